// Each line that ends in "refused" is a mistake that the headers let no host make; the others are what to write.
#include "common/mu_common_config.h"
#include "common/mu_common_file_utils.h"
#include "common/mu_common_state.h"

using namespace common;

struct Host final : IoInterface {
    std::int32_t accept(OdString const& /*path*/) const override { return 1; }
    void report(WriteOutcome const& /*outcome*/) const override {}
};

void use(Cache& cache, RootPath const& root, ConfigPath const& path, Host const& host)
{
    Cache const cache1(root, Host{});             // refused
    Cache const cache2(root, State(), Host{});    // refused
    auto const cache3 = Cache::get(root, Host{}); // refused
    auto const cache4 = Cache::get(root, host);

    Config const config1(path, Host{});                                     // refused
    Config const config2(path, ConfigData(), Host{});                       // refused
    auto const config3 = Config::load(path.path(), Host{});                 // refused
    auto const config4 = Config::factory().get(path, ConfigData(), Host{}); // refused
    auto const config5 = Config::load(path.path(), host);

    cache.getTransaction(); // refused
    Transaction const transaction = cache.getTransaction();

    Cache::get(root, host); // refused
    collectRepoFiles(root); // refused
    auto const files = collectRepoFiles(root);

    OdString& dangling = Expected<OdString>(OdString()).value(); // refused
    for (File& file : collectRepoFiles(root).value()) {
        file.path += L"";
    }
}
