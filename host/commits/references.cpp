#include "host/commits/references.h"

#include "host/failure.h"
#include "host/repository/server_of.h"
#include "host/server/commit_document.h"
#include "host/text/characters.h"

namespace tav {

void makeReference(LocalDatabase& database, common::Reference const& reference)
{
    if (auto const old = database.commits().reference(reference.name)) {
        std::string const kind = old->type == common::EType::branch ? "branch" : "tag";
        throw Failure("There is a " + kind + " '" + reference.name.ansi_str() + "' already.", "Choose another name.");
    }
    if (auto const fault = whyNoReferenceName(reference.name)) {
        throw Failure("The name " + quoted(reference.name) + " " + *fault + ".", "Choose another name.");
    }
    Connection(database).request(
        "references", referenceChanges({{reference, OdString::kEmpty}})); // It is made, not moved.
    Change change(database.database());
    database.commits().set(reference);
    change.commit();
}

} // namespace tav
