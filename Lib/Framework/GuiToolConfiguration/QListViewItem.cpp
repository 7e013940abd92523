#include "QListViewItem.h"

QListViewItem::QListViewItem(const QString& column0, const QString& column1, const QString& column2)
    : m_texts{column0, column1, column2}
{
}

QListViewItem::~QListViewItem() = default;

QString QListViewItem::text(int column) const
{
    if (column < 0 || column > 2)
        return QString();
    return m_texts[column];
}

void QListViewItem::setText(int column, const QString& text)
{
    if (column >= 0 && column <= 2)
        m_texts[column] = text;
}
