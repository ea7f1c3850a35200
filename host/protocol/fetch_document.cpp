#include "host/protocol/fetch_document.h"

#include "host/protocol/document.h"
#include "host/text/json_text.h"

#include "common/mu_common_json_keys.h"
#include "json/json_writer.h"

#include <cstddef>
#include <map>
#include <utility>

namespace tav {

namespace {

using kutils::json::Array;
using kutils::json::Object;
using kutils::json::Value;

namespace keys = common::json;

constexpr std::size_t kMostTrees = 8;

/// Puts the files of commits together, one commit after the other, from those of their parents.
class Trees {
public:
    Trees(CommitTables const& tables, std::vector<CommitRecord> const& commits) : tables_(tables)
    {
        for (CommitRecord const& commit : commits) {
            if (!commit.parents.empty()) {
                ++waiting_[commit.parents.front()];
            }
        }
    }

    /// The files of the next commit, which made `changes`.
    Tree next(CommitRecord const& commit, std::vector<FileRecord> const& changes)
    {
        Tree tree = commit.parents.empty() ? Tree() : filesOfParent(commit.parents.front());
        for (FileRecord const& change : changes) {
            if (change.url.isEmpty()) {
                tree.erase(change.path);
            } else {
                tree.insert_or_assign(change.path, change.url);
            }
        }
        keepForChildren(commit.hash, tree);
        return tree;
    }

private:
    Tree filesOfParent(OdString const& parent)
    {
        auto const kept = kept_.find(parent);
        bool const isLast = --waiting_[parent] == 0;
        if (kept == kept_.end()) {
            Tree tree = tables_.files(parent);
            keepForChildren(parent, tree);
            return tree;
        }
        return isLast ? std::move(kept_.extract(kept).mapped()) : kept->second;
    }

    void keepForChildren(OdString const& hash, Tree const& tree)
    {
        auto const waiting = waiting_.find(hash);
        if (waiting == waiting_.end() || waiting->second == 0) {
            return;
        }
        if (kept_.size() == kMostTrees) {
            kept_.erase(kept_.begin()); // Any will do: what is missed is read again.
        }
        kept_.emplace(hash, tree);
    }

    CommitTables const& tables_;
    std::map<OdString, int> waiting_; ///< commits to come whose first parent it is
    std::map<OdString, Tree> kept_;
};

std::map<OdString, OdString> renamesIn(std::vector<FileRecord> const& changes)
{
    std::map<OdString, OdString> renames;
    for (FileRecord const& change : changes) {
        if (!change.previousPath.isEmpty()) {
            renames.emplace(change.path, change.previousPath);
        }
    }
    return renames;
}

Array filesDocument(Tree const& tree, std::map<OdString, OdString> const& renames)
{
    Array files;
    files.reserve(tree.size());
    for (auto const& [path, url] : tree) {
        Object file;
        auto const rename = renames.find(path);
        file[keys::s_path.c_str()] = jsonText(path);
        if (rename != renames.end()) {
            file[keys::s_previous_path.c_str()] = jsonText(rename->second);
        }
        file[keys::s_storage_path.c_str()] = jsonText(url);
        files.emplace_back(std::move(file));
    }
    return files;
}

Object annotationDocument(CommitRecord const& commit)
{
    Object annotation;
    annotation[L"author"] = jsonText(commit.author);
    annotation[L"date"] = static_cast<double>(commit.date);
    annotation[L"message"] = jsonText(commit.message);
    return annotation;
}

Object commitDocument(CommitRecord const& commit, Array files)
{
    Array parents;
    for (OdString const& parent : commit.parents) {
        parents.emplace_back(jsonText(parent));
    }
    Object document;
    document[keys::s_annotation.c_str()] = annotationDocument(commit);
    document[L"commitNo"] = commit.number;
    document[L"files"] = std::move(files);
    document[keys::s_hash.c_str()] = jsonText(commit.hash);
    document[keys::s_parents.c_str()] = std::move(parents);
    return document;
}

std::wstring commitsText(CommitTables const& tables, std::int64_t known)
{
    std::vector<CommitRecord> const commits = tables.after(known);
    Trees trees(tables, commits);
    std::wstring text;
    for (CommitRecord const& commit : commits) {
        std::vector<FileRecord> const changes = tables.changes(commit.hash);
        Array files = filesDocument(trees.next(commit, changes), renamesIn(changes));
        text += text.empty() ? L"" : L",";
        text += kutils::json::write_string(commitDocument(commit, std::move(files)), false);
    }
    return text;
}

} // namespace

Value referencesDocument(std::vector<common::Reference> const& references)
{
    Array array;
    array.reserve(references.size());
    for (common::Reference const& reference : references) {
        Object object;
        object[keys::s_commitHash.c_str()] = jsonText(reference.commitHash);
        object[keys::s_ref_name.c_str()] = jsonText(reference.name);
        object[L"refType"] =
            jsonText(reference.type == common::EType::tag ? keys::s_ref_tag_type : keys::s_ref_branch_type);
        array.emplace_back(std::move(object));
    }
    return array;
}

Value repositoryDocument(OdString const& id, OdString const& name)
{
    Object object;
    object[L"id"] = jsonText(id);
    object[keys::s_ref_name.c_str()] = jsonText(name);
    return object;
}

OdString fetchDocument(Value const& repository, CommitTables const& tables, std::int64_t known)
{
    // References first: should another process add a commit meanwhile, the commits that they name are still all here.
    std::wstring const references = kutils::json::write_string(referencesDocument(tables.references()), false);
    std::wstring text = L"{\"commits\":[" + commitsText(tables, known) + L"],\"references\":" + references;
    text += L",\"repository\":" + kutils::json::write_string(repository, false) + L"}";
    return OdString(text.data(), text.size());
}

} // namespace tav
