#pragma once

#include "ToolConfigurationCommand.h"

#include "BSet.h"
#include "CComponent_Thread_NoRef.h"
#include "ComponentFixture.h"
#include "CustomEvent.h"
#include "IComponentManager.h"
#include "TempDir.h"
#include "WideString.h"

#include <memory>
#include <string>

class WorkshopInfoUpdater;
class UsersUpdater;
class UpdateUpdater;

// Reaches the controller's private state, which the dialog only sees through the data manager.
class ToolConfigurationCommandTestAccess
{
public:
    static WorkshopInfoUpdater* workshop(ToolConfigurationCommand& c) { return c.m_pWorkshopInfoUpdater; }
    static UsersUpdater* users(ToolConfigurationCommand& c) { return c.m_pUsersUpdater; }
    static UpdateUpdater* update(ToolConfigurationCommand& c) { return c.m_pUpdateUpdater; }
    static std::string app2AppIP(ToolConfigurationCommand& c) { return WideString::toUtf8(c.m_app2AppIP); }
    static const BSet& app2AppValues(ToolConfigurationCommand& c) { return c.m_app2AppValues; }
    static bool recordingMode(ToolConfigurationCommand& c) { return c.m_bRecordingMode; }
    static void setRecordingMode(ToolConfigurationCommand& c, bool on) { c.m_bRecordingMode = on; }
    static void createDMData(ToolConfigurationCommand& c, bool reset) { c.createDMData(reset); }
    static void validateIP(ToolConfigurationCommand& c, ACE_WString& ip) { c.validateIP(ip); }
    static void handleEvent(ToolConfigurationCommand& c, const CustomEvent& e) { c.handleEvent(e); }
    static bool messageBoxAcquired(ToolConfigurationCommand& c) { return c.m_messageBoxManager.isAvailable(); }
    static bool textAcquired(ToolConfigurationCommand& c) { return c.m_bText.isAvailable(); }
    static bool updateAgentAcquired(ToolConfigurationCommand& c) { return c.m_procStartUpdateAgent.isAvailable(); }
};

// A component that is registered but hands out no proxy: whoever asks for it gets nothing.
class UnreachableComponent : public CComponent_Thread_NoRef
{
public:
    explicit UnreachableComponent(const ID& id) : CComponent_Thread_NoRef(id) {}

    static int registerWith(IComponentManager& manager, const wchar_t* id)
    {
        return manager.registerComponent(std::make_unique<UnreachableComponent>(ID(id)),
                                         [](IComponent*) -> ProxyComponent* { return nullptr; });
    }
};

inline ACE_WString wide(const std::string& utf8)
{
    return WideString::fromUtf8(utf8);
}

inline std::string utf8(const ACE_WString& text)
{
    return WideString::toUtf8(text);
}
