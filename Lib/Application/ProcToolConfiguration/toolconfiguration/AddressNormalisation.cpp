#include "AddressNormalisation.h"

#include <QString>
#include <QStringList>

#include <string>

void normaliseDottedAddress(ACE_WString& address)
{
    const QString text = QString::fromWCharArray(address.c_str(), static_cast<qsizetype>(address.length()));
    const QStringList parts = text.split(QLatin1Char('.'), Qt::KeepEmptyParts);
    QString result;
    for (qsizetype i = 0; i < parts.size(); ++i)
    {
        bool ok = false;
        const int value = parts[i].toInt(&ok, 10);
        result += ok ? QString::number(value) : QStringLiteral("0");
        if (i + 1 < parts.size())
            result += QLatin1Char('.');
    }
    const std::wstring wide = result.toStdWString();
    address = ACE_WString(wide.c_str(), wide.size());
}
