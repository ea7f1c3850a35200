/// The picture that stands for an author.
#pragma once

#include <QIcon>
#include <QString>

/// Draws the picture that `resource` names; an empty one for a name that is not known.
QIcon avatarFor(QString const& resource);
