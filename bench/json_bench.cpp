// Reading and writing documents: our values of wide characters beside readers and writers in wide use, each from and to
// its own form of text.
#include "bench/documents.h"
#include "bench/race.h"
#include "platform/sdk/OdString.h"
#include "json/json_reader.h"
#include "json/json_writer.h"

#include <clocale>
#include <memory>
#include <string>

#include <nlohmann/json.hpp>
#include <rapidjson/document.h>

namespace {

using bench::check;
using bench::Table;
using kutils::json::Value;

struct Document {
    std::string name;
    OdString wide;
    std::string narrow;
};

Document documentOf(std::string const& name, Value const& value)
{
    std::wstring const text = kutils::json::write_string(value, true);
    OdString wide(text.c_str(), text.size());
    std::string narrow = wide.ansi_str();
    return {name + ", " + std::to_string(narrow.size() / 1'000'000) + " MB", std::move(wide), std::move(narrow)};
}

void readAndKeep(Table const& table, Document const& document)
{
    Value ours;
    nlohmann::json nlohmann;
    std::unique_ptr<rapidjson::Document> rapid;
    table.race(
        {"read_string", document.name},
        {"read_string", [&] { check(kutils::json::read_string(ours, document.wide), "read"); },
         [&] { ours = Value(); }},
        {{{"nlohmann parse", [&] { nlohmann = nlohmann::json::parse(document.narrow); }, [&] { nlohmann = nullptr; }},
          0.75},
         {{"RapidJSON Parse",
           [&] {
               rapid = std::make_unique<rapidjson::Document>();
               check(!rapid->Parse(document.narrow.data(), document.narrow.size()).HasParseError(), "RapidJSON");
           },
           [&] { rapid.reset(); }},
          std::nullopt}});
}

void readAndDestroy(Table const& table, Document const& document)
{
    table.race(
        {"read_string and destroy", document.name},
        {"read_string",
         [&] {
             Value value;
             check(kutils::json::read_string(value, document.wide), "read");
         }},
        {{{"nlohmann parse and destroy",
           [&] { check(nlohmann::json::parse(document.narrow).is_object(), "nlohmann"); }},
          0.9}});
}

void write(Table const& table, Document const& document, bool pretty)
{
    Value ours;
    check(kutils::json::read_string(ours, document.wide), "read");
    nlohmann::json const nlohmann = nlohmann::json::parse(document.narrow);
    std::wstring wide;
    std::string narrow;
    table.race(
        {pretty ? "write_string pretty" : "write_string compact", document.name},
        {"write_string", [&] { wide = kutils::json::write_string(ours, pretty); }, [&] { wide = std::wstring(); }},
        {{{pretty ? "nlohmann dump(4)" : "nlohmann dump()", [&] { narrow = nlohmann.dump(pretty ? 4 : -1); },
           [&] { narrow = std::string(); }},
          0.4}});
}

void raceAll(Table const& table, Document const& document)
{
    readAndKeep(table, document);
    if (!table.scaling()) {
        readAndDestroy(table, document);
        write(table, document, true);
        write(table, document, false);
    }
}

} // namespace

int main(int argc, char** argv)
{
    std::setlocale(LC_ALL, "C.UTF-8"); // Both write characters beyond ASCII as they are.
    Table const table(argc, argv);
    for (int const records : table.sizes(1'000'000)) {
        raceAll(table, documentOf("state, " + bench::grouped(records), bench::stateDocument(records)));
    }
    if (!table.scaling()) {
        int const commits = table.sizes(10'000).front();
        raceAll(table, documentOf("fetch, " + bench::grouped(commits) + " commits", bench::fetchDocument(commits, 20)));
    }
}
