#include "host/cli/commit_output.h"

#include "host/cli/output.h"
#include "host/text/utf8.h"

#include "platform/sdk/OdTimeStamp.h"
#include "platform/ut/text.h"

#include <array>
#include <cstdio>

namespace tav {

namespace {

std::string formatted(std::int64_t seconds, wchar_t const* form)
{
    OdTimeStamp time;
    time.setPackedValue(seconds);
    OdString text;
    time.strftime(form, text);
    return text.ansi_str();
}

} // namespace

kutils::json::Object documentOf(CommitRecord const& commit)
{
    kutils::json::Array parents;
    for (OdString const& parent : commit.parents) {
        parents.push_back(jsonText(parent));
    }
    kutils::json::Object document;
    document[L"author"] = jsonText(commit.author);
    document[L"date"] = jsonText(fromUtf8(dateMember(commit.date)));
    document[L"hash"] = jsonText(commit.hash);
    document[L"message"] = jsonText(commit.message);
    document[L"number"] = commit.number;
    document[L"parents"] = std::move(parents);
    return document;
}

OdString authorName(CommitRecord const& commit)
{
    OdArray<OdString> const parts = ut::splitByChar(commit.author, L'@', false);
    return parts.isEmpty() ? OdString() : parts.first();
}

std::string dateMember(std::int64_t seconds)
{
    return formatted(seconds, L"%Y-%m-%dT%H:%M:%SZ");
}

std::string dateText(std::int64_t seconds)
{
    return formatted(seconds, L"%Y-%m-%d %H:%M:%S UTC");
}

std::string sizeText(std::uint64_t bytes)
{
    if (bytes < 1000) {
        return std::to_string(bytes) + (bytes == 1 ? " byte" : " bytes");
    }
    constexpr std::array<char const*, 6> kUnits = {"kB", "MB", "GB", "TB", "PB", "EB"};
    double size = static_cast<double>(bytes) / 1000;
    std::size_t unit = 0;
    while (size >= 999.95 && unit + 1 < kUnits.size()) {
        size /= 1000;
        ++unit;
    }
    std::array<char, 32> text{};
    std::snprintf(text.data(), text.size(), "%.1f %s", size, kUnits[unit]);
    return text.data();
}

std::string sizesText(std::optional<std::uint64_t> before, std::optional<std::uint64_t> after)
{
    if (before && after && *before != *after) {
        return sizeText(*before) + " -> " + sizeText(*after);
    }
    std::optional<std::uint64_t> const known = after ? after : before;
    return known ? sizeText(*known) : std::string();
}

std::string changeText(common::FileChange change, OdString const& previousPath)
{
    if (!previousPath.isEmpty()) {
        return "renamed";
    }
    switch (change) {
    case common::FileChange::added: return "new";
    case common::FileChange::modified: return "modified";
    case common::FileChange::removed: return "removed";
    }
    return "changed";
}

std::string changeLine(common::FileChange change, OdString const& path, OdString const& previousPath)
{
    std::string label = changeText(change, previousPath) + ":";
    label.resize(10, ' ');
    return label + (previousPath.isEmpty() ? "" : shown(previousPath) + " -> ") + shown(path);
}

} // namespace tav
