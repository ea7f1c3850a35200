/// Entries of the history list that the user interface shows.
#pragma once

#include "common/mu_common_export.h"

#include "platform/qut/IListItem.h"
#include "platform/sdk/OdString.h"
#include "platform/sdk/OdTimeStamp.h"

#include <QString>

#include <vector>

namespace common {

/// One entry: who made a version, how long ago, and what it is called. A plain value; its setters do nothing, and
/// copies are independent.
class MU_COMMON_EXPORT HistoryItem final : public qut::IListItem {
public:
    /// Copies its arguments.
    HistoryItem(
        OdTimeStamp const& date, OdString const& author, OdString const& name, OdString const& detail, int number);

    /// `name`.
    QString getName() const override;
    /// The resource name of the picture that represents every author.
    QString getLeftIconSource() const override;
    /// The author's name up to the first '@', a dot between spaces, and how long ago `date` is: "less than a minute
    /// ago", minutes, hours, or, after a day or for a date in the future, the date itself. Without an author, only the
    /// time. The phrases are translated. Reads the clock: the text changes as time passes.
    QString getInfo() const override;

    OdTimeStamp date; ///< when the entry was made, in universal time
    OdString author;  ///< as the server reports it
    OdString name;    ///< shown as the entry's name
    OdString detail;  ///< kept for the owner
    int number;       ///< kept for the owner
};

/// A history that has been loaded.
struct MU_COMMON_EXPORT LoadedHistory {
    LoadedHistory() = default;
    /// With a text and no entries.
    explicit LoadedHistory(OdString const& text);

    OdString text;                  ///< what the host shows with it
    std::vector<HistoryItem> items; ///< in the order of the list
};

} // namespace common
