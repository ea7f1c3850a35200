/// What an entry of a list in the Qt user interface offers to it.
#pragma once

#include "platform/mu_platform_export.h"

#include <QString>

namespace qut {

/// Interface of a list entry. Entries are destroyed as what they are, never through this interface.
class MU_PLATFORM_EXPORT IListItem {
public:
    /// The text of the entry.
    virtual QString getName() const = 0;
    /// Resource name of the picture before the text.
    virtual QString getLeftIconSource() const = 0;
    /// Resource name of the picture behind the text; empty for none.
    virtual QString getRightIconSource() const { return {}; }
    /// Whether the text is being edited.
    virtual bool getShowNameEdit() const { return false; }
    /// Starts or ends editing the text.
    virtual void setShowNameEdit(bool /*show*/) {}
    /// A warning shown with the entry; empty for none.
    virtual QString getWarning() const { return {}; }
    /// A line that tells more about the entry.
    virtual QString getInfo() const = 0;
    /// Takes the edited text.
    virtual void setName(QString const& /*name*/) {}
    /// Whether the entry is checked.
    virtual bool isChecked() const { return false; }
    /// Checks the entry or takes that back.
    virtual void setChecked(bool /*checked*/) {}
    /// A handle to the entry's actions, owned by the entry; null when it has none.
    virtual void* getActions() const { return nullptr; }

protected:
    IListItem() = default;
    IListItem(IListItem const&) = default;
    IListItem& operator=(IListItem const&) = default;
    ~IListItem() = default;
};

} // namespace qut
