#include "platform/qut/IListItem.h"

#include <gmock/gmock.h>

namespace {

class Entry : public qut::IListItem {
public:
    QString getName() const override { return "name"; }
    QString getLeftIconSource() const override { return "icon"; }
    QString getInfo() const override { return "info"; }
};

TEST(IListItem, OffersNothingThatTheEntryDoesNotSupply)
{
    Entry entry;
    qut::IListItem& item = entry;
    EXPECT_EQ(item.getRightIconSource(), QString());
    EXPECT_FALSE(item.getShowNameEdit());
    EXPECT_EQ(item.getWarning(), QString());
    EXPECT_FALSE(item.isChecked());
    EXPECT_EQ(item.getActions(), nullptr);
}

TEST(IListItem, SettersChangeNothing)
{
    Entry entry;
    qut::IListItem& item = entry;
    item.setShowNameEdit(true);
    item.setName("other");
    item.setChecked(true);
    EXPECT_FALSE(item.getShowNameEdit());
    EXPECT_EQ(item.getName(), "name");
    EXPECT_FALSE(item.isChecked());
}

TEST(IListItem, HasTheOperationsOfTheEntry)
{
    Entry const entry;
    qut::IListItem const& item = entry;
    EXPECT_EQ(item.getName(), "name");
    EXPECT_EQ(item.getLeftIconSource(), "icon");
    EXPECT_EQ(item.getInfo(), "info");
}

} // namespace
