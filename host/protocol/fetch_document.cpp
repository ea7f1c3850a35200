#include "host/protocol/fetch_document.h"

#include "host/text/json_text.h"

#include "common/mu_common_json_keys.h"

#include <map>
#include <utility>

namespace tav {

namespace {

using kutils::json::Array;
using kutils::json::Object;
using kutils::json::Value;

namespace keys = common::json;

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

OdString wholeCommitText(ChangedCommit const& commit, Tree const& tree)
{
    return compactText(commitDocument(commit.commit, filesDocument(tree, renamesIn(commit.changes))));
}

} // namespace tav
