#include "host/commits/references.h"

#include "host/client/connection.h"
#include "host/errors/failure.h"
#include "host/history/reference_name.h"
#include "host/protocol/commit_document.h"
#include "host/text/characters.h"

namespace tav {

void makeReference(LocalDatabase& database, common::Reference const& reference)
{
    if (auto const old = database.commits().reference(reference.name)) {
        std::string const kind = old->type == common::EType::branch ? "branch" : "tag";
        throw Failure("There is a " + kind + " '" + reference.name.ansi_str() + "' already.", "Choose another name.");
    }
    if (auto const fault = whyNotReferenceName(reference.name)) {
        throw Failure("The name " + quoted(reference.name) + " " + *fault + ".", "Choose another name.");
    }
    Connection(database).request(
        "references", referenceChanges({{reference, OdString::kEmpty}})); // It is made, not moved.
    WriteTransaction transaction(database.database());
    database.commits().set(reference);
    transaction.commit();
}

} // namespace tav
