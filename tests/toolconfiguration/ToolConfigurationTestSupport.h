#pragma once

#include "ToolConfigurationCommand.h"

#include "BBool.h"
#include "BSet.h"
#include "BString.h"
#include "CustomEvent.h"
#include "DialogFixture.h"
#include "UpdateUpdater.h"
#include "UsersUpdater.h"
#include "WorkshopInfoUpdater.h"

#include <memory>
#include <string>
#include <vector>

// Reaches the controller's private state, which the dialog only sees through the data manager.
class ToolConfigurationCommandTestAccess
{
public:
    static WorkshopInfoUpdater* workshop(ToolConfigurationCommand& c) { return c.m_pWorkshopInfoUpdater; }
    static UsersUpdater* users(ToolConfigurationCommand& c) { return c.m_pUsersUpdater; }
    static UpdateUpdater* update(ToolConfigurationCommand& c) { return c.m_pUpdateUpdater; }
    static std::string app2AppIP(ToolConfigurationCommand& c) { return utf8(c.m_app2AppIP); }
    static std::string app2AppValue(ToolConfigurationCommand& c, const char* key)
    {
        ACE_WString value(L"<missing>"_w);
        c.m_app2AppValues.getString(wide(key), value);
        return utf8(value);
    }
    static bool recordingMode(ToolConfigurationCommand& c) { return c.m_bRecordingMode; }
    static void createDMData(ToolConfigurationCommand& c, bool reset) { c.createDMData(reset); }
    static bool updateAgentAcquired(ToolConfigurationCommand& c) { return c.m_procStartUpdateAgent.isAvailable(); }
};

// Port, address and dealer as the users file holds them.
inline std::string app2AppIn(const std::string& usersPath)
{
    UsersUpdater file(wide(usersPath));
    EXPECT_TRUE(file.load());
    return utf8(file.getApp2AppPort() + L" "_w + file.getApp2AppIP() + L" "_w + file.getApp2AppDealerID());
}

// A controller over the dialog fixture's files, and readers of the records it publishes.
class ToolConfigurationTest : public DialogFixture
{
protected:
    void TearDown() override
    {
        m_command.reset();
        DialogFixture::TearDown();
    }

    ToolConfigurationCommand& makeCommand()
    {
        m_command = std::make_unique<ToolConfigurationCommand>(QStringLiteral("WC_TOOLCONFIGURATION"));
        return *m_command;
    }
    UpdateUpdater& update() { return *ToolConfigurationCommandTestAccess::update(*m_command); }

    static ID control(const std::string& name) { return ID(wide("data:/Auto/SystemMenu/" + name)); }
    bool has(const std::string& name) const
    {
        BSet set;
        BString text;
        BBool flag;
        return m_dataManager->getData(control(name), set) == 0 || m_dataManager->getData(control(name), text) == 0 ||
               m_dataManager->getData(control(name), flag) == 0;
    }
    BSet record(const std::string& name) const
    {
        BSet set;
        EXPECT_EQ(m_dataManager->getData(control(name), set), 0) << name;
        return set;
    }
    // A record as "state|text": the edit's item, the two edits, or the combo's selection.
    std::string shown(const std::string& name) const
    {
        const BSet r = record(name);
        long state = -1;
        r.getInt(L"state"_w, state);
        ACE_WString first, second;
        if (r.getString(L"edit1"_w, first) == 0 && r.getString(L"edit2"_w, second) == 0)
            return std::to_string(state) + "|" + utf8(first) + "|" + utf8(second);
        if (r.getString(L"selected"_w, first) != 0)
        {
            BSet value;
            r.getSet(L"value"_w, value);
            value.getString(L"item"_w, first);
        }
        return std::to_string(state) + "|" + utf8(first);
    }
    // The radio buttons Local, A2A and Other as "100", "010" or "001".
    std::string radios() const
    {
        return std::string() + "01"[flag("LocalRadioButton")] + "01"[flag("A2ARadioButton")] +
               "01"[flag("OtherRadioButton")];
    }
    // The brand combo's items as "key=label ".
    std::string brandItems() const
    {
        BSet value;
        record("BrandCombo").getSet(L"value"_w, value);
        std::string result;
        for (int i = 0; i < value.size(); ++i)
            result += utf8(value.keyAt(i)) + "=" + SettingsFiles::stringAt(value, utf8(value.keyAt(i))) + " ";
        return result;
    }
    bool flag(const std::string& name) const
    {
        bool value = false;
        EXPECT_EQ(m_dataManager->getBool(control(name), value), 0) << name;
        return value;
    }
    std::string text(const wchar_t* uri) const
    {
        ACE_WString value(L"<missing>"_w);
        m_dataManager->getString(ID(uri), value);
        return utf8(value);
    }

    std::unique_ptr<ToolConfigurationCommand> m_command;
};
