#pragma once

#include "BSet.h"
#include "Export.h"

#include <ace/SString.h>

#include <string>

// The diagnostic-sheet parameters file: activation flag, up to 20 users in numbered slots and
// the App2App connection parameters.
class TESSEL_EXPORT UsersUpdater
{
public:
    explicit UsersUpdater(const ACE_WString& path);
    UsersUpdater(const UsersUpdater& other);
    UsersUpdater& operator=(const UsersUpdater& other);
    virtual ~UsersUpdater();

    bool isLoaded();
    bool load();
    bool reload();
    bool save();
    // The same, handing back the bytes written (empty on failure).
    bool save(std::string& written);
    unsigned int getMaxUserCount();

    unsigned int getUserCount();
    const ACE_WString getUserName(unsigned int index);
    const ACE_WString getUserAddress(unsigned int index);
    const ACE_WString getUserPhone(unsigned int index);
    bool addUser(const ACE_WString& name, const ACE_WString& address, const ACE_WString& phone);
    bool removeAllUsers();
    bool doesUserExist(const ACE_WString& name);

    bool isActivated();
    bool activate(bool on);
    bool setApp2AppParams(const ACE_WString& port, const ACE_WString& ip, const ACE_WString& dealerId);
    const ACE_WString getApp2AppPort();
    const ACE_WString getApp2AppIP();
    const ACE_WString getApp2AppDealerID();
    long getApp2AppNumRetries();
    double getApp2AppTimeout();
    BSet getApp2AppReqAttrs();

private:
    ACE_WString m_path;
    BSet m_content;
    bool m_loaded;
    // Consecutive used slots from slot 1, kept by load, addUser and removeAllUsers.
    unsigned int m_userCount;
};
