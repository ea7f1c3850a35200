#include "common/mu_common_state.h"

#include "common/mu_common_document.h"
#include "common/mu_common_state_document.h"
#include "common/mu_common_translate.h"

#include <utility>

namespace common {

Cache::Cache(RootPath const& root, State state, IoInterface const& io)
    : dirty_(false)
    , state_(std::move(state))
    , stateFile_(root.statePath())
    , io_(&io)
{
}

Cache::Cache(RootPath const& root, IoInterface const& io) : dirty_(true), stateFile_(root.statePath()), io_(&io) {}

Cache::~Cache()
{
    if (dirty_) {
        io_->report(save());
    }
}

Expected<std::shared_ptr<Cache>> Cache::get(RootPath const& root, IoInterface const& io)
{
    ut::FileName const file(root.statePath());
    if (!file.exists(ut::FileName::kAnyKind)) {
        return ErrorMessage(translate(L"No state file found at %ls"), file.getFullPath().c_str());
    }
    try {
        Expected<State> state = readState(file.getFullPath());
        if (!state.hasValue()) {
            return state.error();
        }
        return std::make_shared<Cache>(root, std::move(state).visit(GetRValueOrThrow<State>{}), io);
    } catch (OdError const& error) {
        return ErrorMessage(error.description());
    }
}

void Cache::create(RootPath const& root, IoInterface const& io)
{
    if (!ut::FileName(root.statePath()).exists(ut::FileName::kAnyKind)) {
        Cache const fresh(root, io);
    }
}

State& Cache::write()
{
    dirty_ = true;
    return state_;
}

Transaction Cache::getTransaction()
{
    return Transaction(*this);
}

WriteOutcome Cache::save() const
{
    try {
        Expected<std::wstring> const text = textOf(state_);
        return text.hasValue() ? writeText(stateFile_.getFullPath(), text.value()) : WriteOutcome(text.error());
    } catch (...) {
        return ErrorMessage(translate(L"An unexpected error occurred while deserializing the state file."));
    }
}

Transaction::Transaction(Cache& cache) : cache_(cache), snapshot_(cache.state_) {}

Transaction::~Transaction()
{
    if (!committed_) {
        cache_.dirty_ = true;
        std::swap(cache_.state_, snapshot_);
    }
}

std::uint64_t modifyTime(OdString const& path, RootPath const& root)
{
    ut::DateTime modification;
    ut::FileName(root.pathTo(path)).getTimes(nullptr, &modification, nullptr);
    return static_cast<std::uint64_t>(modification.getTicks());
}

void updateIndex(OdString const& path, Cache& cache, RootPath const& root)
{
    std::uint64_t const time = modifyTime(path, root);
    cache.write().index[path] = IndexData{time, false};
}

void updateIndex(Cache& cache, RootPath const& root)
{
    for (StagedFile const& file : cache.read().stagedFiles) {
        if (file.change == FileChange::removed) {
            removeIndex(file.path, cache);
        } else {
            updateIndex(file.path, cache, root);
        }
    }
}

void removeIndex(OdString const& path, Cache& cache)
{
    cache.write().index.erase(path);
}

std::map<OdString, IndexData>::iterator
openForWrite(std::map<OdString, IndexData>::const_iterator const& position, Cache& cache)
{
    return cache.write().index.erase(position, position); // Erases nothing: the standard way to lift the const.
}

} // namespace common
