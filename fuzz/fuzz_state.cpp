// Any state file: it is read as the plain algorithm reads it. Loaded, changed and saved, it loads again as it was
// saved; refused, it stays as it is.
#include "fuzz/plain_state.h"

#include "common/mu_common_state.h"

#include "platform/ut/text.h"

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <memory>
#include <string>
#include <system_error>
#include <utility>

namespace {

namespace fs = std::filesystem;

void require(bool holds)
{
    if (!holds) {
        std::abort();
    }
}

// Counts the reports; there must be no errors.
class Host final : public common::IoInterface {
public:
    std::int32_t accept(OdString const& /*path*/) const override { return 1; }
    void report(WriteOutcome const& outcome) const override
    {
        require(outcome.hasValue());
        ++reports;
    }

    mutable int reports = 0;
};

// In the system's folder for temporary files; removed with the process.
class Repository {
public:
    Repository()
    {
        std::string name = (fs::temp_directory_path() / "fuzz_state.XXXXXX").string();
        require(mkdtemp(name.data()) != nullptr);
        folder_ = name;
        fs::create_directory(folder_ / ".tav");
    }
    Repository(Repository const&) = delete;
    Repository& operator=(Repository const&) = delete;
    ~Repository()
    {
        std::error_code ignored;
        fs::remove_all(folder_, ignored);
    }

    void write(std::string const& content) const
    {
        fs::remove(stateFile());
        require(static_cast<bool>(std::ofstream(stateFile(), std::ios::binary) << content));
    }

    std::string read() const
    {
        std::ifstream file(stateFile(), std::ios::binary);
        return {std::istreambuf_iterator<char>(file), {}};
    }

    common::RootPath root() const { return common::RootPath(OdString(folder_.c_str(), CP_UTF_8)); }

private:
    fs::path stateFile() const { return folder_ / ".tav" / "tav.state"; }

    fs::path folder_;
};

bool operator==(common::IndexData const& a, common::IndexData const& b)
{
    return a.lastChecked == b.lastChecked && a.modified == b.modified;
}

bool isSame(common::State const& a, common::State const& b)
{
    auto const sameRecord = [](auto const& x, auto const& y) { return x.first == y.first && x.second == y.second; };
    return a.head == b.head && a.headCommit == b.headCommit && a.stagedFiles == b.stagedFiles &&
           a.renames == b.renames &&
           std::equal(a.index.begin(), a.index.end(), b.index.begin(), b.index.end(), sameRecord);
}

bool isNarrow(OdString const& text)
{
    for (std::size_t i = 0; i < text.getLength(); ++i) {
        if (static_cast<std::uint32_t>(text.getAt(i)) > 0xFFFF) {
            return false;
        }
    }
    return true;
}

// Characters beyond 16 bits do not come back from where the locale calls none beyond ASCII printable.
bool comesBackWhole(common::State const& state)
{
    bool narrow = isNarrow(state.head);
    for (common::StagedFile const& file : state.stagedFiles) {
        narrow = narrow && isNarrow(file.path);
    }
    for (auto const& [path, previous] : state.renames) {
        narrow = narrow && isNarrow(path) && isNarrow(previous);
    }
    for (auto const& [path, data] : state.index) {
        narrow = narrow && isNarrow(path);
    }
    return narrow;
}

void changeAndSave(Repository const& repository, std::shared_ptr<common::Cache> cache, Host const& host)
{
    common::State& state = cache->write();
    state.headCommit.reset(); // A state file that holds one is refused, deliberately.
    state.stagedFiles.emplace_back(L"fuzz/plan.dwg", common::FileChange::added);
    common::updateIndex(L"fuzz/plan.dwg", *cache, repository.root());
    common::removeIndex(L"plan.dwg", *cache);
    common::State const saved = cache->read();
    cache.reset();
    require(host.reports == 1);

    auto const loaded = common::Cache::get(repository.root(), host);
    require(loaded.hasValue());
    require(!comesBackWhole(saved) || isSame(loaded.value()->read(), saved));
}

void compareWithPlainReading(OdString const& path, Expected<std::shared_ptr<common::Cache>> const& loaded)
{
    try {
        common::State const state = plain::readState(ut::readEntireFile(path));
        require(loaded.hasValue() && isSame(loaded.value()->read(), state));
    } catch (OdError const& error) {
        require(!loaded.hasValue() && loaded.error().message == error.description());
    }
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(std::uint8_t const* data, std::size_t size)
{
    static Repository const repository;
    Host const host;
    std::string const document(reinterpret_cast<char const*>(data), size);
    repository.write(document);
    auto cache = common::Cache::get(repository.root(), host);
    require(repository.read() == document);
    compareWithPlainReading(repository.root().statePath(), cache);
    if (cache.hasValue()) {
        changeAndSave(repository, std::move(cache).visit(GetRValueOrThrow<std::shared_ptr<common::Cache>>{}), host);
    }
    return 0;
}
