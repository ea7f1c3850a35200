#include "host/checkout/checkout.h"
#include "host/cli/commands.h"
#include "host/cli/output.h"
#include "host/cli/typed_command.h"
#include "host/commits/commit_names.h"
#include "host/errors/failure.h"
#include "host/repository/open.h"
#include "host/repository/working_state.h"
#include "host/session/write_session.h"
#include "host/text/plural.h"
#include "host/text/utf8.h"

#include <string>

namespace tav {

namespace {

Discard discardOf(CheckoutOptions const& options)
{
    return options.force ? Discard::everything : Discard::nothing;
}

/// "(2 files written, 1 removed)"; nothing where no file had to change.
std::string countsOf(CheckedOut const& result)
{
    std::string text;
    if (result.written > 0) {
        text = counted(result.written, "file") + " written";
    }
    if (result.removed > 0) {
        text += text.empty() ? counted(result.removed, "file") : ", " + std::to_string(result.removed);
        text += " removed";
    }
    return text.empty() ? text : " (" + text + ")";
}

/// `root` is where the move has ended.
std::string described(CheckedOut const& result, common::RootPath const& root)
{
    std::string text = countsOf(result) + ".\n";
    if (result.kept > 0) {
        text +=
            counted(result.kept, "changed file") + (result.kept == 1 ? " stays as it is.\n" : " stay as they are.\n");
    }
    std::size_t const staged = readState(root)->read().stagedFiles.size();
    return staged == 0 ? text : text + counted(staged, "staged file") + " carried along.\n";
}

} // namespace

void checkOut(CheckoutOptions const& options)
{
    WriteSession session(openRepository(""), "checkout");
    CommitRecord const commit = findCommit(session.database(), options.target);
    OdString const branch = readState(session.root())->read().head;
    CheckedOut const result = checkOutCommit(
        session.root(), session.database(), {commit.hash, branch}, typedCommand("checkout", {options.target}),
        discardOf(options), session.start());
    report("Now at commit " + std::to_string(commit.number) + described(result, session.root()));
}

void switchBranch(CheckoutOptions const& options)
{
    WriteSession session(openRepository(""), "switch");
    auto const branch = session.database().commits().reference(fromUtf8(options.target));
    if (branch && branch->type == common::EType::tag) {
        throw Failure("'" + options.target + "' is a tag.", "Use 'tav checkout " + options.target + "' to go there.");
    }
    if (!branch) {
        throw Failure(
            "There is no branch '" + options.target + "'.",
            "Run 'tav branch' to see those that there are, or 'tav branch NAME' to make one.");
    }
    CheckedOut const result = checkOutCommit(
        session.root(), session.database(), {branch->commitHash, branch->name},
        typedCommand("switch", {options.target}), discardOf(options), session.start());
    report("Now on branch " + shown(branch->name) + described(result, session.root()));
}

} // namespace tav
