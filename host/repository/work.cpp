#include "host/repository/work.h"

#include "host/changes/index_record.h"
#include "host/checkout/checkout.h"
#include "host/commits/commit.h"
#include "host/failure.h"
#include "host/repository/unfinished.h"

namespace tav {

namespace {

std::string nameOf(CheckoutUnderWay const& move, LocalDatabase const& database)
{
    auto const branch = database.commits().reference(move.branch);
    bool const isBranch = branch && branch->commitHash == move.target;
    auto const commit = database.commits().find(move.target);
    return isBranch ? "tav switch " + move.branch.ansi_str()
                    : "tav checkout " + (commit ? std::to_string(commit->number) : move.target.ansi_str());
}

std::string interrupted(CheckoutUnderWay const& move, LocalDatabase const& database)
{
    return "'" + nameOf(move, database) + "' was interrupted: the working folder holds files of two commits.";
}

} // namespace

Work::Work(common::RootPath const& root, std::string const& name, Unfinished unfinished)
    : root_(root)
    , lock_(lockRepository(root, name))
    , start_(commandStart(root))
    , database_(LocalDatabase::openForChanges(root))
{
    if (unfinished == Unfinished::isLeft) {
        return;
    }
    try {
        finish();
    } catch (Failure const&) {
        if (unfinished == Unfinished::mustEnd) {
            throw;
        }
    }
}

void Work::finish()
{
    tav::Unfinished const unfinished = unfinishedOf(database_);
    if (auto const* const commit = std::get_if<CommitUnderWay>(&unfinished)) {
        finished_ = finishCommit(root_, database_, *commit);
    }
    auto const* const move = std::get_if<CheckoutUnderWay>(&unfinished);
    if (move && move->isWritten) {
        finishCheckout(root_, database_, *move);
    }
}

void Work::failIfBetweenCommits() const
{
    tav::Unfinished const unfinished = unfinishedOf(database_);
    if (auto const* const move = std::get_if<CheckoutUnderWay>(&unfinished)) {
        throw Failure(interrupted(*move, database_), "Run it again to complete it.");
    }
}

std::string noteOnUnfinished(common::RootPath const& root, LocalDatabase const& database)
{
    OdString const noted = database.unfinished();
    if (noted.isEmpty()) {
        return {};
    }
    if (std::string const holder = lockHolder(root); !holder.empty()) {
        return holder + ", is changing the repository.";
    }
    if (database.unfinished() != noted) { // It has ended meanwhile.
        return {};
    }
    Unfinished const unfinished = unfinishedOf(database);
    if (std::holds_alternative<CommitUnderWay>(unfinished)) {
        return "A commit was interrupted. The next command that changes something completes it.";
    }
    auto const* const move = std::get_if<CheckoutUnderWay>(&unfinished);
    return move && !move->isWritten ? interrupted(*move, database) + " Run it again to complete it." : std::string();
}

} // namespace tav
