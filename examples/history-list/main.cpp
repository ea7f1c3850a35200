// Shows the commits of a fetch, as the server sends it, in a Qt list.
// Usage: history-list FETCH.json [--screenshot FILE.png]
#include "examples/history-list/avatar.h"

#include "common/mu_common_history.h"
#include "common/mu_common_serialization.h"

#include "platform/ut/text.h"
#include "json/json_reader.h"

#include <QAbstractListModel>
#include <QApplication>
#include <QListView>
#include <QPixmap>
#include <QTimer>

#include <cstdio>
#include <exception>
#include <string>
#include <utility>

namespace {

/// Gives the entries of a history to a view; asks each for its texts when they are shown, since they tell its age.
class HistoryModel : public QAbstractListModel {
public:
    explicit HistoryModel(common::LoadedHistory history) : history_(std::move(history)) {}

    int rowCount(QModelIndex const& parent) const override
    {
        return parent.isValid() ? 0 : static_cast<int>(history_.items.size());
    }

    QVariant data(QModelIndex const& index, int role) const override
    {
        common::HistoryItem const& item = history_.items[static_cast<std::size_t>(index.row())];
        switch (role) {
        case Qt::DisplayRole: return QString(item.getName() + QLatin1Char('\n') + item.getInfo());
        case Qt::DecorationRole: return avatarFor(item.getLeftIconSource());
        case Qt::ToolTipRole: return item.getWarning();
        default: return {};
        }
    }

private:
    common::LoadedHistory history_;
};

OdString shortForm(OdString const& hash)
{
    return hash.left(8);
}

common::LoadedHistory loadHistory(OdString const& path)
{
    kutils::json::Value document;
    static_cast<void>(kutils::json::read_string(document, ut::readEntireFile(path)));
    auto const fetched = common::deserializeFetchData(document.get_object());
    if (!fetched.hasValue()) {
        throw OdError(fetched.error().message);
    }
    common::LoadedHistory history(fetched.value().repository.name);
    for (common::Commit const& commit : fetched.value().commits) {
        common::Annotation const& note = commit.annotation;
        history.items.emplace_back(note.date, note.author, note.message, shortForm(commit.hash), commit.commitNo);
    }
    return history;
}

int show(QApplication& application, OdString const& path, QString const& screenshot)
{
    HistoryModel model(loadHistory(path));
    QListView view;
    view.setModel(&model);
    view.setIconSize(QSize(40, 40));
    view.setWindowTitle("History");
    view.resize(480, 320);
    view.show();
    bool saved = screenshot.isEmpty();
    if (!saved) {
        QTimer::singleShot(300, &view, [&] {
            saved = view.grab().save(screenshot);
            application.quit();
        });
    }
    application.exec();
    return saved ? 0 : 1;
}

} // namespace

int main(int argc, char** argv)
{
    QApplication application(argc, argv);
    bool const takesScreenshot = argc == 4 && std::string(argv[2]) == "--screenshot";
    if (argc != 2 && !takesScreenshot) {
        std::fputs("Usage: history-list FETCH.json [--screenshot FILE.png]\n", stderr);
        return 2;
    }
    try {
        return show(application, OdString(argv[1], CP_UTF_8), takesScreenshot ? QString(argv[3]) : QString());
    } catch (std::exception const& error) {
        std::fprintf(stderr, "history-list: %s\n", error.what());
        return 1;
    }
}
