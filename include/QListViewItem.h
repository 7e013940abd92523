#pragma once

#include "Export.h"

#include <QString>

// One row of the users list view: column 0 the name, 1 the address, 2 the telephone.
class TESSEL_EXPORT QListViewItem
{
public:
    QListViewItem(const QString& column0, const QString& column1, const QString& column2);
    virtual ~QListViewItem();

    // The text of the column; empty for a column out of range.
    QString text(int column) const;
    void setText(int column, const QString& text);

private:
    QString m_texts[3];
};
