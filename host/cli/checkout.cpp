#include "host/checkout/checkout.h"
#include "host/cli/commands.h"
#include "host/cli/output.h"
#include "host/commits/commit_names.h"
#include "host/failure.h"
#include "host/repository/open.h"
#include "host/repository/work.h"
#include "host/repository/working_state.h"
#include "host/text/wide.h"

#include <string>

namespace tav {

namespace {

Discard discardOf(CheckoutOptions const& options)
{
    return options.force ? Discard::everything : Discard::nothing;
}

/// `root` is where the move has ended.
std::string described(CheckedOut const& result, common::RootPath const& root)
{
    std::string const text =
        counted(result.written, "file") + " written, " + std::to_string(result.removed) + " removed.\n";
    std::size_t const staged = readState(root)->read().stagedFiles.size();
    return staged == 0 ? text : text + counted(staged, "staged file") + " carried along.\n";
}

} // namespace

void checkOut(CheckoutOptions const& options)
{
    Work work(openRepository(""), "checkout");
    CommitRecord const commit = findCommit(work.database(), options.target);
    OdString const branch = readState(work.root())->read().head;
    CheckedOut const result =
        checkOutCommit(work.root(), work.database(), {commit.hash, branch}, discardOf(options), work.start());
    print(
        "The working folder is at commit " + std::to_string(commit.number) + " now: " + described(result, work.root()));
}

void switchBranch(CheckoutOptions const& options)
{
    Work work(openRepository(""), "switch");
    auto const branch = work.database().commits().reference(wide(options.target));
    if (branch && branch->type == common::EType::tag) {
        throw Failure("'" + options.target + "' is a tag.", "Use 'tav checkout " + options.target + "' to go there.");
    }
    if (!branch) {
        throw Failure(
            "There is no branch '" + options.target + "'.",
            "Run 'tav branch' to see those that there are, or 'tav branch NAME' to make one.");
    }
    CheckedOut const result = checkOutCommit(
        work.root(), work.database(), {branch->commitHash, branch->name}, discardOf(options), work.start());
    print("On branch " + shown(branch->name) + " now: " + described(result, work.root()));
}

} // namespace tav
