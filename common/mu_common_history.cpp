#include "common/mu_common_history.h"

#include "common/mu_common_translate.h"

#include "platform/qut/toQt.h"
#include "platform/ut/text.h"

namespace common {

namespace {

constexpr std::int32_t kMinute = 60000; // milliseconds
constexpr std::int32_t kHour = 60 * kMinute;

OdString formatted(OdTimeStamp const& time, wchar_t const* pattern)
{
    OdString text;
    time.strftime(pattern, text);
    return text;
}

OdString timeText(OdTimeStamp const& date)
{
    OdTimeStamp age(OdTimeStamp::kInitUniversalTime);
    age -= date;
    if (age.julianDay() != 0) {
        return formatted(date, L"%b %#d, %Y");
    }
    if (age.msecsPastMidnight() < kMinute) {
        return translate(L"less than a minute ago");
    }
    if (age.msecsPastMidnight() < kHour) {
        return formatted(age, L"%#M  ") + translate(L"minutes ago");
    }
    return formatted(age, L"%#H ") + translate(L"hours ago");
}

} // namespace

HistoryItem::HistoryItem(
    OdTimeStamp const& made, OdString const& madeBy, OdString const& title, OdString const& more, int runningNumber)
    : date(made)
    , author(madeBy)
    , name(title)
    , detail(more)
    , number(runningNumber)
{
}

QString HistoryItem::getName() const
{
    return qut::toQt(name);
}

QString HistoryItem::getLeftIconSource() const
{
    return QStringLiteral("avatar-placeholder.svg");
}

QString HistoryItem::getInfo() const
{
    OdArray<OdString> const pieces = ut::splitByChar(author, L'@', false);
    OdString const time = timeText(date);
    return qut::toQt(pieces.isEmpty() ? time : pieces.first() + L" \u2981 " + time);
}

LoadedHistory::LoadedHistory(OdString const& loaded) : text(loaded) {}

} // namespace common
