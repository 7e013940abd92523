#pragma once

#include <QString>

// Texts of the dialogs, asked from the text component; the default when it is not there.
class DialogTexts
{
public:
    static QString text(const QString& textId, const QString& defaultText);
};
