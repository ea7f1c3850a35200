#include "host/undo/log_size.h"

#include "host/errors/failure.h"

#include <limits>
#include <set>
#include <vector>

namespace tav {

namespace {

/// Adds up what only operations need. A content that several name counts once.
class NeededByLog {
public:
    NeededByLog(LocalDatabase const& database, LocalStorage const& storage) : storage_(storage)
    {
        for (auto const& urls : {database.commits().urls(), database.shelves().urls()}) {
            counted_.insert(urls.begin(), urls.end());
        }
    }

    void add(Operation const& operation)
    {
        for (FileContents const& file : operation.files) {
            add(file.before);
            add(file.after);
        }
    }

    std::uint64_t length() const { return length_; }

private:
    void add(OdString const& url)
    {
        if (url.isEmpty() || !counted_.insert(url).second) {
            return;
        }
        auto const size = storage_.size(url);
        length_ += size.hasValue() ? size.value() : 0; // One that cannot be read takes no room that could be won.
    }

    LocalStorage const& storage_;
    std::set<OdString> counted_;
    std::uint64_t length_ = 0;
};

bool isUnderWay(Phase phase)
{
    return phase == Phase::running || phase == Phase::undoing || phase == Phase::redoing;
}

/// From the first operation on with which the contents are too long, the newest aside.
std::vector<std::int64_t> tooMuch(LocalDatabase const& database, LocalStorage const& storage, std::uint64_t most)
{
    NeededByLog needed(database, storage);
    std::vector<std::int64_t> old;
    bool isNewest = true;
    for (Operation& operation : database.operations().latest(std::numeric_limits<std::int32_t>::max())) {
        database.operations().readDetails(operation);
        needed.add(operation);
        if (!isNewest && needed.length() > most && !isUnderWay(operation.phase)) {
            old.push_back(operation.id);
        }
        isNewest = false;
    }
    return old;
}

} // namespace

std::size_t limitLog(LocalDatabase& database, LocalStorage const& storage, std::uint64_t most)
{
    std::vector<std::int64_t> const old = tooMuch(database, storage, most);
    WriteTransaction transaction(database.database());
    for (std::int64_t const id : old) {
        database.operations().remove(id);
    }
    transaction.commit();
    return old.size();
}

} // namespace tav
