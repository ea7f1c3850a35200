#include "examples/history-list/avatar.h"

#include <QColor>
#include <QPainter>
#include <QPainterPath>
#include <QPixmap>

QIcon avatarFor(QString const& resource)
{
    if (resource != QLatin1String("avatar-placeholder.svg")) {
        return {};
    }
    constexpr int kSize = 64;
    QPixmap picture(kSize, kSize);
    picture.fill(Qt::transparent);
    QPainter painter(&picture);
    painter.setRenderHint(QPainter::Antialiasing);
    painter.setPen(Qt::NoPen);
    QPainterPath disc;
    disc.addEllipse(0, 0, kSize, kSize);
    painter.setClipPath(disc);
    painter.fillPath(disc, QColor(0x4A, 0x6F, 0xA5));
    painter.setBrush(QColor(0xF4, 0xF1, 0xEA));
    painter.drawEllipse(22, 13, 20, 22); // head
    painter.drawEllipse(10, 40, 44, 40); // shoulders
    return QIcon(picture);
}
