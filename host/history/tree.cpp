#include "host/history/tree.h"

#include "host/text/characters.h"

#include <algorithm>
#include <cstddef>

namespace tav {

namespace {

bool beginsWith(OdString const& text, OdString const& beginning)
{
    return text.getLength() >= beginning.getLength() &&
           std::equal(beginning.c_str(), beginning.c_str() + beginning.getLength(), text.c_str());
}

/// Sorts '/' before every other character, so that the content of a folder follows the folder at once.
bool isBeforeInTree(FileRecord const* a, FileRecord const* b)
{
    auto const rank = [](wchar_t c) { return c == L'/' ? L'\0' : c; };
    return std::lexicographical_compare(
        a->path.c_str(), a->path.c_str() + a->path.getLength(), b->path.c_str(), b->path.c_str() + b->path.getLength(),
        [rank](wchar_t c, wchar_t d) { return rank(c) < rank(d); });
}

} // namespace

std::optional<std::string> whyNotTree(std::vector<FileRecord> const& files)
{
    std::vector<FileRecord const*> sorted;
    sorted.reserve(files.size());
    for (FileRecord const& file : files) {
        sorted.push_back(&file);
    }
    std::sort(sorted.begin(), sorted.end(), isBeforeInTree);
    for (std::size_t i = 1; i < sorted.size(); ++i) {
        OdString const& before = sorted[i - 1]->path;
        if (before == sorted[i]->path) {
            return "must not hold the path " + quoted(before) + " twice";
        }
        if (beginsWith(sorted[i]->path, before + L"/")) {
            return "must not hold " + quoted(before) + " both as a file and as a folder";
        }
    }
    return std::nullopt;
}

std::vector<FileRecord> changesBetween(Tree parent, std::vector<FileRecord> const& files)
{
    std::vector<FileRecord> changes;
    for (FileRecord const& file : files) {
        auto const before = parent.find(file.path);
        bool const isSame = before != parent.end() && before->second == file.url && file.previousPath.isEmpty();
        if (!isSame) {
            changes.push_back(file);
        }
        if (before != parent.end()) {
            parent.erase(before);
        }
    }
    for (auto const& [path, url] : parent) {
        changes.push_back({path, OdString(), OdString()});
    }
    return changes;
}

} // namespace tav
