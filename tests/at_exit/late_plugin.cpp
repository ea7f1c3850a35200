// What the late host keeps: objects with changes that are saved when they go, and the names that hosts see.
#include "common/mu_common_config.h"
#include "common/mu_common_json_keys.h"
#include "common/mu_common_state.h"

#include <cstdint>
#include <cstdio>
#include <filesystem>
#include <initializer_list>
#include <memory>
#include <string>

namespace {

using namespace common;

/// Prints the outcome of a save. Never destroyed, as its documentation asks for.
class PrintingIo final : public IoInterface {
public:
    std::int32_t accept(OdString const& /*path*/) const override { return 1; }
    void report(WriteOutcome const& outcome) const override
    {
        std::puts(outcome.hasValue() ? "saved" : outcome.error().message.ansi_str().c_str());
    }
};

PrintingIo const& io()
{
    static PrintingIo const& instance = *new PrintingIo;
    return instance;
}

OdString wide(char const* folder)
{
    return {folder, CP_UTF_8};
}

void printNames(void const* /*nothing*/)
{
    for (OdString const* name : {&OdString::kEmpty,
                                 &s_defaultMaster,
                                 &json::s_head,
                                 &json::s_reference,
                                 &json::s_commit,
                                 &json::s_staged_files,
                                 &json::s_path,
                                 &json::s_renames,
                                 &json::s_new_name,
                                 &json::s_previous_name,
                                 &json::s_staged_references,
                                 &json::s_references,
                                 &json::s_ref_name,
                                 &json::s_ref_type,
                                 &json::s_ref_branch_type,
                                 &json::s_ref_tag_type,
                                 &json::s_hash,
                                 &json::s_blob_path,
                                 &json::s_storage_path,
                                 &json::s_previous_path,
                                 &json::s_parents,
                                 &json::s_annotation,
                                 &json::s_commitHash}) {
        std::printf("%s.", name->ansi_str().c_str());
    }
}

} // namespace

#define PLUGIN extern "C" __attribute__((visibility("default")))

PLUGIN void keepState(char const* folder, std::shared_ptr<void>& kept)
{
    auto const cache = Cache::get(RootPath(wide(folder)), io());
    State& state = cache.value()->write();
    state.head = L"a branch with a long name";
    state.stagedFiles.emplace_back(L"plans/ground.dwg", FileChange::modified);
    state.renames[L"plans/roof-new.dwg"] = L"plans/roof.dwg";
    state.index[L"plans/ground.dwg"] = {1'700'000'000, false};
    kept = cache.value();
}

PLUGIN void keepStateOfAFolderThatGoes(char const* folder, std::shared_ptr<void>& kept)
{
    keepState(folder, kept);
    std::string const elsewhere = std::string(folder) + "/elsewhere";
    std::puts(Cache::get(RootPath(wide(elsewhere.c_str())), io()).error().message.ansi_str().c_str());
    std::filesystem::remove_all(std::string(folder) + "/.tav");
}

PLUGIN void keepConfiguration(char const* folder, std::shared_ptr<void>& kept)
{
    auto const config = Config::load(wide(folder), io());
    config.value()->write()->add(L"/projects/house", L"House at the lake", L"1234567");
    kept = config.value();
}

PLUGIN void keepNames(char const* /*folder*/, std::shared_ptr<void>& kept)
{
    kept = std::shared_ptr<void>(&kept, printNames);
}
