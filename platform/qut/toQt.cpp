#include "platform/qut/toQt.h"

#include <QChar>

namespace qut {
namespace {

// Not QString::fromUcs4: that one drops a byte-order mark at the beginning.
void append(QString& result, uint character)
{
    if (!QChar::requiresSurrogates(character)) {
        result.append(QChar(character));
    } else if (character <= QChar::LastValidCodePoint) {
        result.append(QChar(QChar::highSurrogate(character)));
        result.append(QChar(QChar::lowSurrogate(character)));
    } else {
        result.append(QChar(QChar::ReplacementCharacter));
    }
}

} // namespace

QString toQt(OdString const& text)
{
    QString result;
    result.reserve(static_cast<int>(text.getLength()));
    for (std::size_t i = 0; i < text.getLength(); ++i) {
        append(result, static_cast<uint>(text.getAt(i)));
    }
    return result;
}

} // namespace qut
