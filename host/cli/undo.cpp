#include "host/undo/undo.h"

#include "host/cli/commands.h"
#include "host/cli/commit_output.h"
#include "host/cli/output.h"
#include "host/errors/failure.h"
#include "host/repository/open.h"
#include "host/session/write_session.h"
#include "host/text/plural.h"
#include "host/text/utf8.h"

#include "platform/sdk/OdTimeStamp.h"

#include <limits>
#include <string>
#include <vector>

namespace tav {

namespace {

char const* stateText(Phase phase)
{
    switch (phase) {
    case Phase::done: return "done";
    case Phase::undone: return "undone";
    case Phase::superseded: return "superseded";
    default: return "running";
    }
}

kutils::json::Object documentOf(Operation const& operation)
{
    OdTimeStamp time;
    time.setPackedValue(operation.date);
    OdString date;
    time.strftime(L"%Y-%m-%dT%H:%M:%SZ", date);
    kutils::json::Object document;
    document[L"command"] = jsonText(operation.command);
    document[L"date"] = jsonText(date);
    document[L"id"] = operation.id;
    document[L"state"] = jsonText(fromUtf8(stateText(operation.phase)));
    return document;
}

void list(UndoOptions const& options)
{
    LocalDatabase const database = LocalDatabase::open(openRepository(""));
    std::size_t const count = options.count == 0 ? std::numeric_limits<std::int32_t>::max() : options.count;
    std::vector<Operation> const operations =
        database.hasOperations() ? database.operations().latest(count) : std::vector<Operation>();
    if (options.json) {
        kutils::json::Array array;
        for (Operation const& operation : operations) {
            array.emplace_back(documentOf(operation));
        }
        printJson(std::move(array));
        return;
    }
    if (operations.empty()) {
        print("There is nothing to undo.\n");
    }
    for (Operation const& operation : operations) {
        std::string const note =
            operation.phase == Phase::done ? "" : std::string(" (") + stateText(operation.phase) + ")";
        print(
            std::to_string(operation.id) + "  " + dateText(operation.date) + "  " + shown(operation.command) + note +
            "\n");
    }
}

Operation nextOrFail(LocalDatabase const& database, Side to)
{
    auto operation = database.hasOperations() ? nextToTurn(database, to) : std::nullopt;
    if (!operation) {
        throw Failure(
            to == Side::before ? "There is nothing to undo." : "There is nothing to redo.", "See 'tav undo --list'.");
    }
    return *std::move(operation);
}

std::string countsOf(Turned const& turned)
{
    return turned.written + turned.removed == 0
               ? ""
               : ": " + counted(turned.written, "file") + " written, " + std::to_string(turned.removed) + " removed";
}

void printTurned(Operation const& operation, Turned const& turned, Side to)
{
    report(
        std::string(to == Side::before ? "Took back '" : "Did again '") + shown(operation.command) + "'" +
        countsOf(turned) + ".\n");
    for (OdString const& path : turned.kept) {
        report("        overwritten: " + shown(path) + "\n");
    }
    if (!turned.kept.empty()) {
        report(std::string("Run 'tav ") + (to == Side::before ? "redo" : "undo") + "' to have those back.\n");
    }
}

void printDocument(Operation const& operation, Turned const& turned)
{
    kutils::json::Object document = documentOf(operation);
    kutils::json::Array kept;
    for (OdString const& path : turned.kept) {
        kept.push_back(jsonText(path));
    }
    document[L"kept"] = std::move(kept);
    document[L"removed"] = static_cast<std::uint64_t>(turned.removed);
    document[L"written"] = static_cast<std::uint64_t>(turned.written);
    printJson(std::move(document));
}

void turnNext(UndoOptions const& options, Side to)
{
    WriteSession session(openRepository(""), to == Side::before ? "undo" : "redo");
    Operation operation = nextOrFail(session.database(), to);
    Discard const discard = options.force ? Discard::everything : Discard::nothing;
    Turned const turned = turn(session.root(), session.database(), operation, to, discard, session.start());
    operation.phase = to == Side::before ? Phase::undone : Phase::done;
    if (options.json) {
        printDocument(operation, turned);
    } else {
        printTurned(operation, turned, to);
    }
}

std::string lineOf(FileContents const& file, Side to)
{
    bool const isRemoved = (to == Side::before ? file.before : file.after).isEmpty();
    return std::string(isRemoved ? "        remove: " : "        write:  ") + shown(file.path) + "\n";
}

void preview(UndoOptions const& options, Side to)
{
    LocalDatabase const database = LocalDatabase::open(openRepository(""));
    Operation const operation = nextOrFail(database, to);
    if (options.json) {
        printJson(documentOf(operation));
        return;
    }
    print(
        std::string(to == Side::before ? "Would take back '" : "Would do again '") + shown(operation.command) +
        "' of " + dateText(operation.date) + ".\n");
    for (FileContents const& file : operation.files) {
        print(lineOf(file, to));
    }
}

void turnOrShow(UndoOptions const& options, Side to)
{
    if (options.list) {
        list(options);
    } else if (options.dryRun) {
        preview(options, to);
    } else {
        turnNext(options, to);
    }
}

} // namespace

void undo(UndoOptions const& options)
{
    turnOrShow(options, Side::before);
}

void redo(UndoOptions const& options)
{
    turnOrShow(options, Side::after);
}

} // namespace tav
