#include "DialogTexts.h"

#include "PBText.h"
#include "SmartProxy.h"

#include <string>

QString DialogTexts::text(const QString& textId, const QString& defaultText)
{
    SmartProxy<PBText> texts;
    if (!texts.acquire(ID("tessel:BText?BText")))
        return defaultText;
    const std::wstring id = textId.toStdWString();
    const std::wstring fallback = defaultText.toStdWString();
    const ACE_WString answer =
        texts->getText(ACE_WString(id.c_str(), id.size()), ACE_WString(fallback.c_str(), fallback.size()));
    return QString::fromWCharArray(answer.c_str(), static_cast<qsizetype>(answer.length()));
}
