#include "UsersUpdater.h"

#include "BString.h"
#include "StringUtilities.h"
#include "TesselLog_Static.h"

#include <algorithm>
#include <cwchar>
#include <iterator>

namespace
{
const char* const kComponent = "ProcToolConfiguration";
const char* const kFile = "ProcToolConfiguration.dll";
const char* const kClass = "UsersUpdater";

const unsigned int kMaxUserCount = 20;

const wchar_t* const kActivation = L"activation";
const wchar_t* const kUsers = L"users";
const wchar_t* const kName = L"name";
const wchar_t* const kAddress = L"address";
const wchar_t* const kTelephone = L"telephone";
const wchar_t* const kFreeSlot = L"0";
const wchar_t* const kApp2App = L"App2App";
const wchar_t* const kPort = L"Port";
const wchar_t* const kIP = L"IP";
const wchar_t* const kNumRetries = L"NumRetries";
const wchar_t* const kTimeout = L"Timeout";
const wchar_t* const kRequestAttributes = L"RequestAttributes";
const wchar_t* const kApplication = L"application";
const wchar_t* const kService = L"service";
const wchar_t* const kDealerId = L"dealerId";

const wchar_t* const kAddUserPrefix =
    L"[bool UsersUpdater::addUser(const ACE_WString&, const ACE_WString&, const ACE_WString&)]";
const wchar_t* const kDoesUserExistPrefix = L"[bool UsersUpdater::doesUserExist(const ACE_WString&)]";

void trace(const wchar_t* message)
{
    TesselLog_Static::logTrace_static(kComponent, kFile, kClass, message);
}

void warn(const wchar_t* prefix, const wchar_t* text)
{
    ACE_WString message(prefix);
    message += text;
    TesselLog_Static::logWarning_static(kComponent, kFile, kClass, message.c_str());
}

void traceStarted(const wchar_t* prefix)
{
    // Built on the stack: the prefixes are short literals of this file.
    static const wchar_t kStarted[] = L": Method started.";
    wchar_t message[256];
    const std::size_t length = std::min(std::wcslen(prefix), std::size(message) - std::size(kStarted));
    std::wmemcpy(message, prefix, length);
    std::wmemcpy(message + length, kStarted, std::size(kStarted));
    trace(message);
}

// The operations' common entry: trace, then whether the store may be used.
bool enter(bool loaded, const wchar_t* prefix)
{
    traceStarted(prefix);
    if (!loaded)
        warn(prefix, L": File not loaded");
    return loaded;
}

// One of this file's key literals as a key, without copying it.
ACE_WString keyOf(const wchar_t* literal)
{
    return ACE_WString(literal, nullptr, false);
}

// "user" followed by the slot number in decimal, written into `text`; the key refers to it.
ACE_WString slotKey(unsigned int slot, wchar_t (&text)[16])
{
    wchar_t digits[12];
    std::size_t count = 0;
    do
    {
        digits[count++] = static_cast<wchar_t>(L'0' + slot % 10);
        slot /= 10;
    } while (slot != 0);
    std::wmemcpy(text, L"user", 4);
    std::size_t length = 4;
    while (count > 0)
        text[length++] = digits[--count];
    return ACE_WString(text, length, nullptr, false);
}

// The nested set under key, read in place; null when absent or not a set.
const BSet* nestedSet(const BSet& parent, const ACE_WString& key)
{
    const BData* value = parent.find(key);
    return value != nullptr && value->type() == BData::eSET ? static_cast<const BSet*>(value) : nullptr;
}

ACE_WString readString(const BSet* set, const wchar_t* key)
{
    ACE_WString value;
    if (set != nullptr)
        set->getString(key, value);
    return value;
}

// A field of slot number `slot` (1 to 20); empty when the slot or the field is missing.
ACE_WString readSlotField(const BSet& content, unsigned int slot, const wchar_t* field)
{
    const BSet* users = nestedSet(content, kUsers);
    if (users == nullptr)
        return ACE_WString();
    wchar_t text[16];
    return readString(nestedSet(*users, slotKey(slot, text)), field);
}

bool isUsedName(const ACE_WString& name)
{
    return name.length() != 0 && !(name.length() == 1 && name[0] == kFreeSlot[0]);
}

// The number of consecutive used slots from slot `from` + 1 on, plus `from`.
unsigned int countUsedSlots(const BSet& content, unsigned int from)
{
    const BSet* users = nestedSet(content, keyOf(kUsers));
    unsigned int count = from;
    if (users == nullptr)
        return count;
    const ACE_WString nameKey = keyOf(kName);
    while (count < kMaxUserCount)
    {
        wchar_t text[16];
        const BSet* slot = nestedSet(*users, slotKey(count + 1, text));
        const BData* name = slot != nullptr ? slot->find(nameKey) : nullptr;
        if (name == nullptr || name->type() != BData::eSTRING ||
            !isUsedName(static_cast<const BString*>(name)->value()))
            break;
        ++count;
    }
    return count;
}
}

UsersUpdater::UsersUpdater(const ACE_WString& path) : m_path(path), m_content(10), m_loaded(false), m_userCount(0)
{
    trace(L"[UsersUpdater::UsersUpdater(const ACE_WString&)]: Constructor started.");
}

UsersUpdater::UsersUpdater(const UsersUpdater& other) = default;

UsersUpdater& UsersUpdater::operator=(const UsersUpdater& other) = default;

UsersUpdater::~UsersUpdater()
{
    trace(L"[UsersUpdater::~UsersUpdater()]: Destructor started.");
}

bool UsersUpdater::isLoaded()
{
    traceStarted(L"[bool UsersUpdater::isLoaded()]");
    return m_loaded;
}

bool UsersUpdater::load()
{
    traceStarted(L"[bool UsersUpdater::load()]");
    if (m_loaded)
    {
        warn(L"[bool UsersUpdater::load()]", L": File already loaded");
        return true;
    }
    // Read into a fresh set so the content is exactly the file's, also on reload.
    BSet fromFile(10);
    m_loaded = fromFile.load(m_path);
    if (!m_loaded)
        return false;
    m_content = std::move(fromFile);
    m_userCount = countUsedSlots(m_content, 0);

    if (nestedSet(m_content, kApp2App) == nullptr)
    {
        BSet requestAttributes(10);
        requestAttributes.setString(kApplication, L"vexa");
        requestAttributes.setString(kService, L"sfd");
        BSet defaults(10);
        defaults.setInt(kNumRetries, 3);
        defaults.setDouble(kTimeout, 3.0);
        defaults.setSet(kRequestAttributes, std::move(requestAttributes));
        m_content.setSet(kApp2App, std::move(defaults));
    }
    return m_loaded;
}

bool UsersUpdater::reload()
{
    m_loaded = false;
    return load();
}

bool UsersUpdater::save()
{
    std::string written;
    return save(written);
}

bool UsersUpdater::save(std::string& written)
{
    written.clear();
    if (!enter(m_loaded, L"[bool UsersUpdater::save()]"))
        return false;
    return m_content.save(m_path, false, written);
}

unsigned int UsersUpdater::getMaxUserCount()
{
    traceStarted(L"[unsigned int UsersUpdater::getMaxUserCount()]");
    return kMaxUserCount;
}

unsigned int UsersUpdater::getUserCount()
{
    if (!enter(m_loaded, L"[unsigned int UsersUpdater::getUserCount()]"))
        return 0;
    return m_userCount;
}

const ACE_WString UsersUpdater::getUserName(unsigned int index)
{
    const wchar_t* prefix = L"[const ACE_WString UsersUpdater::getUserName(unsigned int)]";
    if (!enter(m_loaded, prefix))
        return ACE_WString();
    if (index >= kMaxUserCount)
    {
        warn(prefix, L": Index out of range");
        return ACE_WString();
    }
    return readSlotField(m_content, index + 1, kName);
}

const ACE_WString UsersUpdater::getUserAddress(unsigned int index)
{
    const wchar_t* prefix = L"[const ACE_WString UsersUpdater::getUserAddress(unsigned int)]";
    if (!enter(m_loaded, prefix))
        return ACE_WString();
    if (index >= kMaxUserCount)
    {
        warn(prefix, L": Index out of range");
        return ACE_WString();
    }
    return readSlotField(m_content, index + 1, kAddress);
}

const ACE_WString UsersUpdater::getUserPhone(unsigned int index)
{
    const wchar_t* prefix = L"[const ACE_WString UsersUpdater::getUserPhone(unsigned int)]";
    if (!enter(m_loaded, prefix))
        return ACE_WString();
    if (index >= kMaxUserCount)
    {
        warn(prefix, L": Index out of range");
        return ACE_WString();
    }
    return readSlotField(m_content, index + 1, kTelephone);
}

bool UsersUpdater::addUser(const ACE_WString& name, const ACE_WString& address, const ACE_WString& phone)
{
    if (!enter(m_loaded, kAddUserPrefix))
        return false;
    // Only the name is required: users without address or telephone are kept.
    if (name.length() == 0)
    {
        warn(kAddUserPrefix, L": Empty Name, Address or Phone");
        return false;
    }
    const unsigned int count = getUserCount();
    if (count >= kMaxUserCount)
    {
        warn(kAddUserPrefix, L": Max user count reached");
        return false;
    }
    wchar_t text[16];
    BSet& slot = m_content.editSet(keyOf(kUsers)).editSet(slotKey(count + 1, text));
    slot.setString(keyOf(kName), name);
    slot.setString(keyOf(kAddress), address);
    slot.setString(keyOf(kTelephone), phone);
    // Filling a gap joins the used slots after it.
    if (isUsedName(name))
        m_userCount = countUsedSlots(m_content, count + 1);
    return true;
}

bool UsersUpdater::removeAllUsers()
{
    if (!enter(m_loaded, L"[bool UsersUpdater::removeAllUsers()]"))
        return false;
    BSet& users = m_content.editSet(keyOf(kUsers));
    const ACE_WString nameKey = keyOf(kName);
    const ACE_WString addressKey = keyOf(kAddress);
    const ACE_WString telephoneKey = keyOf(kTelephone);
    const ACE_WString freeMark(kFreeSlot);
    for (unsigned int number = 1; number <= kMaxUserCount; ++number)
    {
        wchar_t text[16];
        BSet& slot = users.editSet(slotKey(number, text));
        slot.setString(nameKey, freeMark);
        slot.setString(addressKey, freeMark);
        slot.setString(telephoneKey, freeMark);
    }
    m_userCount = 0;
    return true;
}

bool UsersUpdater::doesUserExist(const ACE_WString& name)
{
    if (!enter(m_loaded, kDoesUserExistPrefix))
        return false;
    if (name.length() == 0)
    {
        warn(kDoesUserExistPrefix, L": Empty UserName ");
        return false;
    }
    const BSet* users = nestedSet(m_content, kUsers);
    if (users == nullptr)
        return false;
    for (unsigned int slot = 1; slot <= kMaxUserCount; ++slot)
    {
        wchar_t text[16];
        if (readString(nestedSet(*users, slotKey(slot, text)), kName) == name)
            return true;
    }
    return false;
}

bool UsersUpdater::isActivated()
{
    if (!enter(m_loaded, L"[bool UsersUpdater::isActivated()]"))
        return false;
    const ACE_WString value = readString(&m_content, kActivation);
    return StringUtilities::toInt(value.c_str()) != 0;
}

bool UsersUpdater::activate(bool on)
{
    if (!enter(m_loaded, L"[bool UsersUpdater::activate(bool)]"))
        return false;
    m_content.setString(kActivation, on ? L"1" : L"0");
    return true;
}

bool UsersUpdater::setApp2AppParams(const ACE_WString& port, const ACE_WString& ip, const ACE_WString& dealerId)
{
    if (!enter(m_loaded,
               L"[bool UsersUpdater::setApp2AppParams(const ACE_WString&, const ACE_WString&, const ACE_WString&)]"))
        return false;
    BSet& app2App = m_content.editSet(kApp2App);
    app2App.setString(kPort, port);
    app2App.setString(kIP, ip);
    app2App.editSet(kRequestAttributes).setString(kDealerId, dealerId);
    return true;
}

const ACE_WString UsersUpdater::getApp2AppPort()
{
    if (!enter(m_loaded, L"[const ACE_WString UsersUpdater::getApp2AppPort()]"))
        return ACE_WString();
    return readString(nestedSet(m_content, kApp2App), kPort);
}

const ACE_WString UsersUpdater::getApp2AppIP()
{
    if (!enter(m_loaded, L"[const ACE_WString UsersUpdater::getApp2AppIP()]"))
        return ACE_WString();
    return readString(nestedSet(m_content, kApp2App), kIP);
}

const ACE_WString UsersUpdater::getApp2AppDealerID()
{
    if (!enter(m_loaded, L"[const ACE_WString UsersUpdater::getApp2AppDealerID()]"))
        return ACE_WString();
    const BSet* app2App = nestedSet(m_content, kApp2App);
    if (app2App == nullptr)
        return ACE_WString();
    return readString(nestedSet(*app2App, kRequestAttributes), kDealerId);
}

long UsersUpdater::getApp2AppNumRetries()
{
    if (!enter(m_loaded, L"[long UsersUpdater::getApp2AppNumRetries()]"))
        return -1;
    long value = -1;
    if (const BSet* app2App = nestedSet(m_content, kApp2App))
        app2App->getInt(kNumRetries, value);
    return value;
}

double UsersUpdater::getApp2AppTimeout()
{
    if (!enter(m_loaded, L"[double UsersUpdater::getApp2AppTimeout()]"))
        return -1.0;
    double value = -1.0;
    if (const BSet* app2App = nestedSet(m_content, kApp2App))
        app2App->getDouble(kTimeout, value);
    return value;
}

BSet UsersUpdater::getApp2AppReqAttrs()
{
    trace(L"[BSet UsersUpdater::getApp2AppReqAttrs()]: Method started.");
    BSet requestAttributes(10);
    if (const BSet* app2App = nestedSet(m_content, kApp2App))
        app2App->getSet(kRequestAttributes, requestAttributes);
    return requestAttributes;
}
