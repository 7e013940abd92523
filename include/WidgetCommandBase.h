#pragma once

#include "Export.h"

#include <QObject>
#include <QString>

// Base of the dialog controllers: a QObject with a command identifier.
class TESSEL_EXPORT WidgetCommandBase : public QObject
{
    Q_OBJECT

public:
    explicit WidgetCommandBase(const QString& commandID);
    ~WidgetCommandBase() override;

    virtual bool init();
    virtual QString getCommandID() const;
    virtual void setNotificationSkipping(bool skip);
    bool isNotificationSkipping() const;

private:
    QString m_commandID;
    bool m_notificationSkipping;
};
