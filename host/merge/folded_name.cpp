#include "host/merge/folded_name.h"

#include "platform/qut/toQt.h"

#include <QString>

#include <string>

namespace tav {

OdString foldedName(OdString const& path)
{
    QString const decomposed = qut::toQt(path).normalized(QString::NormalizationForm_D);
    std::wstring const folded = decomposed.toCaseFolded().normalized(QString::NormalizationForm_C).toStdWString();
    return {folded.c_str(), folded.size()};
}

} // namespace tav
