// Reading a document of the size of a large commit: our reader and a reader in wide use, each from its own text form.
#include "bench/race.h"
#include "platform/sdk/OdString.h"
#include "json/json_reader.h"

#include <cstdlib>
#include <string>

#include <nlohmann/json.hpp>

namespace {

std::string fileEntry(int number)
{
    std::string const digits = std::to_string(number);
    return R"({"path":"services/heating/\u00c9tage )" + digits + R"(/H-)" + digits +
           R"(.dwg","storagePath":"sha/e3b0c44298fc1c149afbf4c8996fb92427ae41e4649b934ca495991b7852b855",)"
           R"("change":"modified","size":)" +
           std::to_string(100'000 + number) + R"(,"time":17)" + std::to_string(10'000'000 + number) +
           R"(.25,"binary":true,"previous":null})";
}

std::string commit(int files)
{
    std::string text = R"({"author":"anna","message":"Heating moved to the north side","files":[)";
    for (int i = 0; i < files; ++i) {
        text += (i > 0 ? "," : "") + fileEntry(i);
    }
    return text + "]}";
}

} // namespace

int main(int argc, char** argv)
{
    constexpr int kFiles = 20'000;
    std::string const narrow = commit(kFiles);
    OdString const wide(narrow.c_str(), CP_UTF_8);

    bench::Race race("read a commit of 20,000 files, " + std::to_string(narrow.size() / 1000) + " kB");
    race.ours("kutils::json::read_string", [&] {
        kutils::json::Value value;
        if (!kutils::json::read_string(value, wide) || value.get_object().at(L"files").get_array().size() != kFiles) {
            std::abort();
        }
    });
    race.peer("nlohmann::json::parse", [&] {
        if (nlohmann::json::parse(narrow).at("files").size() != kFiles) {
            std::abort();
        }
    });
    return race.run(argc, argv);
}
