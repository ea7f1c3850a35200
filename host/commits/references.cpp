#include "host/commits/references.h"

#include "host/failure.h"
#include "host/repository/server_of.h"
#include "host/server/commit_document.h"
#include "host/text/characters.h"
#include "host/text/json_text.h"

namespace tav {

namespace {

OdString documentOf(common::Reference const& reference)
{
    kutils::json::Object object;
    object[L"name"] = jsonText(reference.name);
    object[L"commitHash"] = jsonText(reference.commitHash);
    object[L"refType"] = reference.type == common::EType::branch ? L"branch" : L"tag";
    return compactText(kutils::json::Array{std::move(object)});
}

} // namespace

void makeReference(LocalDatabase& database, common::Reference const& reference)
{
    if (auto const old = database.commits().reference(reference.name)) {
        std::string const kind = old->type == common::EType::branch ? "branch" : "tag";
        throw Failure("There is a " + kind + " '" + reference.name.ansi_str() + "' already.", "Choose another name.");
    }
    if (auto const fault = whyNoReferenceName(reference.name)) {
        throw Failure("The name " + quoted(reference.name) + " " + *fault + ".", "Choose another name.");
    }
    Connection(database).request("references", documentOf(reference));
    Change change(database.database());
    database.commits().set(reference);
    change.commit();
}

} // namespace tav
