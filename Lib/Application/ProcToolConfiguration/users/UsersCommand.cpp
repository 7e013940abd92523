#include "UsersCommand.h"

#include "BDataUtilities.h"
#include "BSet.h"
#include "BString.h"
#include "Dialog_EditDiagUserInfo.h"
#include "ID.h"
#include "PBText.h"
#include "PMessageBoxManager.h"
#include "SafeWidgetDecorator.h"
#include "StringUtilities.h"
#include "TesselLog_Static.h"
#include "UsersUpdater.h"

#include <QLineEdit>

#include <memory>
#include <string>
#include <utility>

namespace
{
const char* const kComponent = "ProcToolConfiguration";
const char* const kFile = "ProcToolConfiguration.dll";
const char* const kClass = "UsersCommand";

const wchar_t* const kDataManagerID = L"tessel:DM?DataManager";
const wchar_t* const kBTextID = L"tessel:BText?BText";
const wchar_t* const kMessageBoxManagerID = L"tessel:Navigation?MessageBoxManager";

const wchar_t* const kUserSetUri = L"data:/Auto/SystemMenu/Users/UserSet";
const wchar_t* const kUsersFileUri = L"data:/Configuration/DoC/FicheDiagnostic/FicheDiagParamsFileName";
const wchar_t* const kUsersFileDefault = L"../../Data/User/FicheDiagParams.xml";
const wchar_t* const kWorkshopPhoneUri = L"data:/Auto/SystemMenu/PhoneNumberEdit";

const wchar_t* const kUserKeyPrefix = L"User#";
const size_t kUserKeyPrefixLength = 5;
const int kMaxUsers = 20;

// Catalogue numbers of the texts and their defaults.
const int kTitleText = 969;
const wchar_t* const kTitleDefault = L"Properties";
const int kFullText = 986;
const wchar_t* const kFullDefault = L"The maximum number of users has been reached!";
const int kOkText = 19009;
const wchar_t* const kOkDefault = L"OK";
const int kQuestionText = 985;
const wchar_t* const kQuestionDefault = L"Do you really want to remove the user? ";
const int kYesText = 4531;
const wchar_t* const kYesDefault = L"YES";
const int kNoText = 4532;
const wchar_t* const kNoDefault = L"NO";

const int kQuestionKind = 1;
const int kNoticeKind = 2;

void trace(const wchar_t* message)
{
    TesselLog_Static::logTrace_static(kComponent, kFile, kClass, message);
}

void warning(const wchar_t* message)
{
    TesselLog_Static::logWarning_static(kComponent, kFile, kClass, message);
}

// Exact conversions: every character survives, whatever its code.
ACE_WString toWide(const QString& text)
{
    const std::wstring wide = text.toStdWString();
    return ACE_WString(wide.c_str(), wide.size());
}

QString toQString(const ACE_WString& text)
{
    return QString::fromWCharArray(text.c_str(), static_cast<qsizetype>(text.length()));
}

// "User#<index>" for an index from 0.
ACE_WString userKey(int index)
{
    return StringUtilities::withNumber(kUserKeyPrefix, static_cast<unsigned int>(index));
}

QString translated(PBText& text, int number, const wchar_t* defaultText)
{
    return toQString(text.getText(number, ACE_WString(defaultText)));
}

// The "name" of the entry of `index`; empty when the entry or its name is missing.
ACE_WString nameAt(const BSet& users, int index)
{
    BSet entry(10);
    ACE_WString name;
    if (users.getSet(userKey(index), entry) == 0)
        entry.getString(L"name", name);
    return name;
}
}

UsersCommand::UsersCommand(const QString& commandID) : WidgetCommandBase(commandID), m_dataManager()
{
    m_dataManager.acquire(ID(kDataManagerID));
    trace(L"[UsersCommand::UsersCommand] : Constructor started.");
    createDMUsersData();
}

UsersCommand::~UsersCommand()
{
    trace(L"[UsersCommand::~UsersCommand] : Destructor started.");
    m_dataManager.giveBack();
}

bool UsersCommand::init()
{
    return true;
}

void UsersCommand::createDMUsersData()
{
    trace(L"[UsersCommand::createDMUsersData] : Method started.");
    if (!m_dataManager.isAvailable())
        return;

    ACE_WString path(kUsersFileDefault);
    m_dataManager->getString(ID(kUsersFileUri), path);

    UsersUpdater store(path);
    BSet users(10);
    if (store.load())
    {
        // Every used slot, in slot order, also past a free one; the keys have no gaps.
        int published = 0;
        for (unsigned int slot = 0; slot < store.getMaxUserCount(); ++slot)
        {
            const ACE_WString name = store.getUserName(slot);
            if (name.is_empty() || name == ACE_WString(L"0"))
                continue;
            auto entry = std::make_unique<BSet>(3);
            entry->put(L"name", std::make_unique<BString>(name));
            entry->put(L"phone", std::make_unique<BString>(store.getUserPhone(slot)));
            entry->put(L"address", std::make_unique<BString>(store.getUserAddress(slot)));
            users.put(userKey(published++), std::move(entry));
        }
    }
    m_dataManager->createData(ID(kUserSetUri), std::move(users));
}

void UsersCommand::populateForbiddenList(const BSet& users, QStringList& names)
{
    trace(L"[UsersCommand::populateForbiddenList] : Method started.");
    const int count = users.size();
    for (int i = 0; i < count; ++i)
        names.append(toQString(nameAt(users, i)));
}

void UsersCommand::findKeyForUser(const QString& name, ACE_WString& key)
{
    trace(L"[UsersCommand::findKeyForUser] : Method started.");
    BSet users(10);
    if (m_dataManager.isAvailable())
        m_dataManager->getData(ID(kUserSetUri), users);
    const int count = users.size();
    for (int i = 0; i < count; ++i)
    {
        if (toQString(nameAt(users, i)) == name)
        {
            key = userKey(i);
            return;
        }
    }
    key = userKey(count);
}

void UsersCommand::decorateDialog(Dialog_EditDiagUserInfo& dialog)
{
    trace(L"[UsersCommand::decorateDialog] : Method started.");
    SafeWidgetDecorator::getInstance()->decorate(QStringLiteral("Style85"), dialog, true);
}

BSet UsersCommand::readUserEntry(const Dialog_EditDiagUserInfo& dialog)
{
    const QString name = dialog.m_nameEdit->text();
    QString phone = dialog.m_phoneEdit->text();
    const QString address = dialog.m_addressEdit->text();

    ACE_WString phoneText = toWide(phone);
    if (phone.isEmpty())
    {
        // The workshop's number, as the dialog's telephone control shows it.
        phoneText.clear();
        BSet record(10);
        BSet value(10);
        if (m_dataManager.isAvailable() && m_dataManager->getData(ID(kWorkshopPhoneUri), record) == 0 &&
            record.getSet(L"value", value) == 0)
            value.getString(L"item", phoneText);
    }

    BSet entry(10);
    entry.set(L"name", BString(toWide(name)));
    entry.set(L"phone", BString(phoneText));
    entry.set(L"address", BString(toWide(address)));
    return entry;
}

void UsersCommand::onModifyClicked(const QListViewItem* listItem)
{
    trace(L"[UsersCommand::onModifyClicked] : Method started.");
    if (!m_dataManager.isAvailable())
    {
        warning(L"[UsersCommand::onModifyClicked] : Cannot get proxy to DataManager.");
        return;
    }
    if (listItem == nullptr)
    {
        warning(L"[UsersCommand::onModifyClicked] : No user item given.");
        return;
    }

    BSet users(10);
    m_dataManager->getData(ID(kUserSetUri), users);

    const QString oldName = listItem->text(0);
    QStringList names;
    populateForbiddenList(users, names);
    names.removeAll(oldName);

    Dialog_EditDiagUserInfo dialog(names, nullptr, nullptr, Qt::WindowFlags());
    decorateDialog(dialog);

    SmartProxy<PBText> text;
    if (!text.acquire(ID(kBTextID)))
        return;

    dialog.init(translated(*text.get(), kTitleText, kTitleDefault));
    dialog.m_nameEdit->setText(oldName);
    dialog.m_addressEdit->setText(listItem->text(1));
    dialog.m_phoneEdit->setText(listItem->text(2));
    if (dialog.exec() != 1)
        return;

    const BSet entry = readUserEntry(dialog);
    ACE_WString key;
    findKeyForUser(oldName, key);
    m_dataManager->getData(ID(kUserSetUri), users);
    users.set(key, entry);
    m_dataManager->setData(ID(kUserSetUri), users);
}

void UsersCommand::onAddClicked()
{
    trace(L"[UsersCommand::onAddClicked] : Method started.");
    if (!m_dataManager.isAvailable())
        return;
    BSet users(10);
    m_dataManager->getData(ID(kUserSetUri), users);

    SmartProxy<PBText> text;
    if (!text.acquire(ID(kBTextID)))
        return;

    if (users.size() >= kMaxUsers)
    {
        SmartProxy<PMessageBoxManager> boxes;
        if (boxes.acquire(ID(kMessageBoxManagerID)))
            boxes->showMessageBox(translated(*text.get(), kTitleText, kTitleDefault),
                                  translated(*text.get(), kFullText, kFullDefault), kNoticeKind,
                                  translated(*text.get(), kOkText, kOkDefault), QString(), QString());
        return;
    }

    QStringList names;
    populateForbiddenList(users, names);

    Dialog_EditDiagUserInfo dialog(names, nullptr, nullptr, Qt::WindowFlags());
    decorateDialog(dialog);
    dialog.init(translated(*text.get(), kTitleText, kTitleDefault));
    if (dialog.exec() != 1)
        return;

    const BSet entry = readUserEntry(dialog);
    ACE_WString key;
    findKeyForUser(dialog.m_nameEdit->text(), key);
    m_dataManager->getData(ID(kUserSetUri), users);
    users.set(key, entry);
    m_dataManager->setData(ID(kUserSetUri), users);
}

void UsersCommand::onDeleteClicked(const QListViewItem* listItem)
{
    trace(L"[UsersCommand::onDeleteClicked] : Method started.");
    if (listItem == nullptr)
    {
        warning(L"[UsersCommand::onDeleteClicked] : No user item given.");
        return;
    }
    const QString name = listItem->text(0);

    SmartProxy<PMessageBoxManager> boxes;
    if (boxes.acquire(ID(kMessageBoxManagerID)))
    {
        SmartProxy<PBText> text;
        if (!text.acquire(ID(kBTextID)))
            return;
        const QString question = translated(*text.get(), kQuestionText, kQuestionDefault) + name + QStringLiteral("?");
        const int answer = boxes->showMessageBox(translated(*text.get(), kTitleText, kTitleDefault), question,
                                                 kQuestionKind, translated(*text.get(), kYesText, kYesDefault),
                                                 translated(*text.get(), kNoText, kNoDefault), QString());
        if (answer != 1)
            return;
    }
    boxes.giveBack();

    if (!m_dataManager.isAvailable())
        return;
    BSet users(10);
    m_dataManager->getData(ID(kUserSetUri), users);
    const int count = users.size();

    ACE_WString key;
    findKeyForUser(name, key);
    const int index = StringUtilities::toInt(key.substr(kUserKeyPrefixLength).c_str());
    if (index >= count)
    {
        // Nobody of that name: nothing to remove.
        warning(L"[UsersCommand::onDeleteClicked] : User not found, nothing removed.");
        return;
    }

    if (count == 1)
    {
        BDataUtilities::removeBSetSubElement(users, userKey(0));
    }
    else
    {
        for (int i = index; i < count; ++i)
        {
            BSet next(10);
            users.getSet(userKey(i + 1), next);
            users.set(userKey(i), next);
        }
        BDataUtilities::removeBSetSubElement(users, userKey(count - 1));
    }
    m_dataManager->setData(ID(kUserSetUri), users);
}
