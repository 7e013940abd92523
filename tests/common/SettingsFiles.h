#pragma once

#include "BSet.h"
#include "TempDir.h"
#include "TestText.h"
#include "Users.h"

#include <gtest/gtest.h>

#include <string>
#include <utility>
#include <vector>

// Writers and readers of the three settings files, in the data library's layout.
namespace SettingsFiles
{
inline void save(const BSet& set, const std::string& path)
{
    TempDir::write(path, "");
    ASSERT_TRUE(set.save(wide(path), false)) << path;
}

inline BSet read(const std::string& path)
{
    BSet result(10);
    EXPECT_TRUE(result.load(wide(path))) << path;
    return result;
}

inline std::string stringAt(const BSet& set, const std::string& key)
{
    ACE_WString value;
    set.getString(wide(key), value);
    return utf8(value);
}

// Workshop file: key/value pairs ("nom", "ville", ...).
inline void writeWorkshop(const std::string& path, const std::vector<std::pair<std::string, std::string>>& fields)
{
    BSet set(10);
    for (const auto& field : fields)
        set.setString(wide(field.first), wide(field.second));
    save(set, path);
}

struct App2App
{
    std::string port = "8080";
    std::string ip = "10.0.0.7";
    std::string dealerId = "D77";
};

// Users file: activation, the users in slots user1.., and the App2App block.
inline void writeUsers(const std::string& path, const std::vector<User>& users, const App2App& app2App = {},
                       const std::string& activation = "1")
{
    BSet slotSet(10);
    for (size_t i = 0; i < users.size(); ++i)
    {
        BSet slot(10);
        slot.setString(L"name"_w, wide(users[i].name));
        slot.setString(L"address"_w, wide(users[i].address));
        slot.setString(L"telephone"_w, wide(users[i].phone));
        slotSet.setSet(wide("user" + std::to_string(i + 1)), slot);
    }
    BSet attributes(10);
    attributes.setString(L"dealerId"_w, wide(app2App.dealerId));
    BSet block(10);
    block.setString(L"Port"_w, wide(app2App.port));
    block.setString(L"IP"_w, wide(app2App.ip));
    block.setSet(L"RequestAttributes"_w, attributes);
    BSet content(10);
    content.setString(L"activation"_w, wide(activation));
    content.setSet(L"users"_w, slotSet);
    content.setSet(L"App2App"_w, block);
    save(content, path);
}

struct Update
{
    bool enabled = false;
    std::string mode = "LOCAL";
    std::string folder = "/srv/dist";
    std::string localFolder = "/var/local/repo";
    std::string time = "07:30:00";
};

// Online-update settings file.
inline void writeUpdate(const std::string& path, const Update& update = {})
{
    BSet set(10);
    set.setBool(L"OnlineUpdateActivated"_w, update.enabled);
    set.setString(L"DeploymentMode"_w, wide(update.mode));
    set.setString(L"DistributionFolderPath"_w, wide(update.folder));
    set.setString(L"LocalDistributionFolderPath"_w, wide(update.localFolder));
    set.setString(L"UpdateRetrievalTime"_w, wide(update.time));
    save(set, path);
}

// The users a users file holds, slot by slot up to the first free one.
inline std::vector<User> usersIn(const std::string& path)
{
    const BSet content = read(path);
    BSet slotSet(10);
    content.getSet(L"users"_w, slotSet);
    std::vector<User> result;
    for (int slot = 1; slot <= 20; ++slot)
    {
        BSet entry(10);
        if (slotSet.getSet(wide("user" + std::to_string(slot)), entry) != 0)
            break;
        const std::string name = stringAt(entry, "name");
        if (name.empty() || name == "0")
            break;
        result.push_back({name, stringAt(entry, "address"), stringAt(entry, "telephone")});
    }
    return result;
}
}
