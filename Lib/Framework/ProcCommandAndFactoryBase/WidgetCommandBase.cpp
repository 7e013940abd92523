#include "WidgetCommandBase.h"

WidgetCommandBase::WidgetCommandBase(const QString& commandID)
    : QObject(nullptr),
      m_commandID(commandID),
      m_notificationSkipping(false)
{
}

WidgetCommandBase::~WidgetCommandBase() = default;

bool WidgetCommandBase::init()
{
    return true;
}

QString WidgetCommandBase::getCommandID() const
{
    return m_commandID;
}

void WidgetCommandBase::setNotificationSkipping(bool skip)
{
    m_notificationSkipping = skip;
}

bool WidgetCommandBase::isNotificationSkipping() const
{
    return m_notificationSkipping;
}
