#include "platform/sdk/OdError.h"

namespace {

wchar_t const* sentenceOf(OdResult code)
{
    switch (code) {
    case eOk: return L"No error.";
    case eOutOfMemory: return L"Out of memory.";
    }
    return L"Unknown error.";
}

} // namespace

OdError::OdError(OdString const& message) : message_(message), narrow_(message.ansi_str()) {}

OdError::OdError(OdResult code) : OdError(OdString(sentenceOf(code)))
{
    code_ = code;
}
