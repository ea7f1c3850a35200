#include "bench/documents.h"

#include <cstdint>
#include <utility>

namespace bench {

using kutils::json::Array;
using kutils::json::Object;
using kutils::json::Value;

namespace {

std::wstring digits(int number, std::size_t length)
{
    std::wstring const text = std::to_wstring(number);
    return std::wstring(length > text.size() ? length - text.size() : 0, L'0') + text;
}

Value record(int number)
{
    Object data;
    data[L"last_checked"] = std::uint64_t{1'700'000'000'000'000'000} + static_cast<std::uint64_t>(number) * 1'000'003;
    data[L"modified"] = number % 16 == 0;
    Object entry;
    entry[L"data"] = std::move(data);
    entry[L"path"] = drawingPath(number);
    return entry;
}

Value file(int number)
{
    Object entry;
    entry[L"path"] = drawingPath(number);
    entry[L"storagePath"] = L"sha/e3b0c44298fc1c149afbf4c8996fb92427ae41e4649b934ca495991b" + digits(number, 8);
    if (number % 10 == 0) {
        entry[L"previousPath"] = drawingPath(number + 1);
    }
    return entry;
}

Value commit(int number, int files)
{
    Array list;
    for (int i = 0; i < files; ++i) {
        list.push_back(file(number * files + i));
    }
    Object annotation;
    annotation[L"author"] = L"anna";
    annotation[L"date"] = L"2024-03-05T10:20:30Z";
    annotation[L"message"] = L"Heating moved to the north side,\nstairs as agreed with the \"client\"";
    Object entry;
    entry[L"annotation"] = std::move(annotation);
    entry[L"files"] = std::move(list);
    entry[L"hash"] = L"9f86d081884c7d659a2feaa0c55ad015a3bf4f1b2b0b822cd15d6c15" + digits(number, 8);
    entry[L"number"] = static_cast<std::uint64_t>(number);
    entry[L"parentsHashes"] =
        Array{Value(L"60303ae22b998861bce3b28f33eec1be758a213c86c93c076dbe9f55" + digits(number, 8))};
    return entry;
}

} // namespace

std::wstring drawingPath(int number)
{
    std::wstring const kind = number / 100 % 8 == 0 ? L"/\u00C9tage-" : L"/floor-";
    return L"project-" + digits(number / 10'000, 3) + kind + digits(number / 100 % 100, 2) + L"/drawing-" +
           digits(number, 7) + L".dwg";
}

Value stateDocument(int records)
{
    Array index;
    index.reserve(static_cast<std::size_t>(records));
    for (int i = 0; i < records; ++i) {
        index.push_back(record(i));
    }
    Object head;
    head[L"reference"] = L"master";
    Object root;
    root[L"head"] = std::move(head);
    root[L"index"] = std::move(index);
    return root;
}

Value fetchDocument(int commits, int files)
{
    Array list;
    list.reserve(static_cast<std::size_t>(commits));
    for (int i = 0; i < commits; ++i) {
        list.push_back(commit(i, files));
    }
    Object repository;
    repository[L"name"] = L"hospital";
    Object root;
    root[L"commits"] = std::move(list);
    root[L"repository"] = std::move(repository);
    return root;
}

} // namespace bench
