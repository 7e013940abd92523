#include "ToolConfigurationCommand.h"

#include "AddressNormalisation.h"
#include "BBool.h"
#include "BInt.h"
#include "BOStream.h"
#include "BString.h"
#include "CIniFile.h"
#include "CLogsZipperGui.h"
#include "OnLineUpdateCommand.h"
#include "PMediator.h"
#include "StringSet.h"
#include "StringUtilities.h"
#include "TesselLog_Static.h"
#include "UpdateUpdater.h"
#include "UsersCommand.h"
#include "UsersUpdater.h"
#include "WideString.h"
#include "WorkshopInfoUpdater.h"

#include <ace/Guard_T.h>

#include <QEvent>
#include <QFileDialog>

#include <algorithm>
#include <deque>
#include <memory>
#include <numeric>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace
{
const char* const kComponent = "ProcToolConfiguration";
const char* const kFile = "ProcToolConfiguration.dll";
const char* const kClass = "ToolConfigurationCommand";

const int kFileChangedEvent = 668;
const long kStateEditable = 3;
const long kStateFixed = 2;
const long kStateDisplayOnly = 19;

const wchar_t* const kControlUriPrefix = L"data:/Auto/SystemMenu/";
const wchar_t* const kActivePreparateur = L"ActivePreparateur";
const wchar_t* const kDistributionFolder = L"DistributionFolderPath";
const wchar_t* const kModeLocal = L"LOCAL";
const wchar_t* const kModeA2A = L"A2A";
const wchar_t* const kModeOther = L"OTHER";
const wchar_t* const kTaskTimeUri = L"data:/Auto/SystemMenu/TaskTimeEdit";
const wchar_t* const kUpdateTmpFileDefault = L"../../Data/User/OnLineUpdate/PreparateurTmp.xml";
const wchar_t* const kUpdateTmpFileUri = L"data:/Configuration/MenuBar/PreparateurConfigFileTmp";

const wchar_t* const kUsersFileDefault = L"../../Data/User/FicheDiagParams.xml";
const wchar_t* const kUsersFileUri = L"data:/Configuration/DoC/FicheDiagnostic/FicheDiagParamsFileName";
const wchar_t* const kWorkshopFileDefault = L"../../Data/User/InformationsGarage.xml";
const wchar_t* const kWorkshopFileUri = L"data:/Configuration/MenuBar/WorkshopFile";
const wchar_t* const kUpdateFileDefault = L"../../Data/User/OnLineUpdate/Preparateur.xml";
const wchar_t* const kUpdateFileUri = L"data:/Configuration/MenuBar/PreparateurConfigFile";
const wchar_t* const kIniFileUri = L"data:/Configuration/MarvaneNet/Applet/ConfHF";
const wchar_t* const kBrandsUri = L"data:/Configuration/DoC/Config_Accueil/Brands";

const wchar_t* const kDataManagerID = L"tessel:DM?DataManager";
const wchar_t* const kBTextID = L"tessel:BText?BText";
const wchar_t* const kMessageBoxManagerID = L"tessel:Navigation?MessageBoxManager";
const wchar_t* const kUpdateAgentID = L"proc:ProcStartUpdateAgent?ProcStartUpdateAgent";
const wchar_t* const kWatcherID = L"util:FileSystemUtilities?CQ17FileSystemWatcher";
const wchar_t* const kMediatorID = L"gui:GuiToolConfiguration?MedToolConfiguration#ToolConfiguaration.ui";
const wchar_t* const kUserSetUri = L"data:/Auto/SystemMenu/Users/UserSet";
const wchar_t* const kEnableOnlineUpdateUri = L"data:/Configuration/MenuBar/EnableOnlineUpdate";

void trace(const wchar_t* message)
{
    TesselLog_Static::logTrace_static(kComponent, kFile, kClass, message);
}

void warning(const wchar_t* message)
{
    TesselLog_Static::logWarning_static(kComponent, kFile, kClass, message);
}

ID controlUri(const ACE_WString& name)
{
    ACE_WString uri(kControlUriPrefix);
    uri += name.c_str();
    return ID(uri);
}

// "User#<index>" for an index from 0.
ACE_WString userKey(int index)
{
    return StringUtilities::withNumber(L"User#", static_cast<unsigned int>(index));
}

ACE_WString toWide(const QString& text)
{
    const std::wstring wide = text.toStdWString();
    return ACE_WString(wide.c_str(), wide.size());
}

QString toQString(const ACE_WString& text)
{
    return QString::fromWCharArray(text.c_str(), static_cast<qsizetype>(text.length()));
}

// The App2App server's repository share: \\<address>\TLD_REPOSITORY.
ACE_WString app2AppSharePath(const ACE_WString& address)
{
    ACE_WString path(L"\\\\");
    path += address;
    path += L"\\TLD_REPOSITORY";
    return path;
}

// Asks for a folder. The answer is the one the dialog reports through its own signal, so whoever
// answers the dialog (a person, or a test through fileSelected) is read the same way.
QString chooseDirectory()
{
    QFileDialog dialog(nullptr, QStringLiteral("Choose a directory"), QStringLiteral("/home"));
    dialog.setFileMode(QFileDialog::Directory);
    dialog.setOption(QFileDialog::ShowDirsOnly);
    QString chosen;
    QObject::connect(&dialog, &QFileDialog::fileSelected, &dialog, [&chosen](const QString& path) { chosen = path; });
    if (dialog.exec() != QDialog::Accepted)
        return QString();
    return chosen;
}

// The brand number right-justified to four characters with '0'; longer keys stay as they are.
const size_t kBrandKeyWidth = 4;

ACE_WString padBrandKey(const ACE_WString& key)
{
    if (key.length() >= kBrandKeyWidth)
        return key;
    wchar_t padded[kBrandKeyWidth];
    const size_t zeros = kBrandKeyWidth - key.length();
    std::fill(padded, padded + zeros, L'0');
    std::copy(key.c_str(), key.c_str() + key.length(), padded + zeros);
    return ACE_WString(padded, kBrandKeyWidth);
}

// An edit record: { "state": state, "value": { "item": text } }.
BSet makeEditRecord(long state, const ACE_WString& text)
{
    BSet record(10);
    record.set(L"state", BInt(state));
    BSet value(10);
    value.set(L"item", BString(text));
    record.set(L"value", value);
    return record;
}

// A two-edit record: { "state": 3, "edit1": first, "edit2": second }.
BSet makeTwoEditRecord(const ACE_WString& edit1Text, const ACE_WString& edit2Text)
{
    BSet record(10);
    record.set(L"state", BInt(kStateEditable));
    record.set(L"edit1", BString(edit1Text));
    record.set(L"edit2", BString(edit2Text));
    return record;
}
}

const ID ToolConfigurationCommand::m_ID(L"processing:ProcToolConfiguration?ToolConfigurationCommand");

ToolConfigurationCommand::ToolConfigurationCommand(const QString& commandID)
    : WidgetCommandBase(commandID),
      Handler<CustomEvent>(),
      m_pWorkshopInfoUpdater(nullptr),
      m_pUsersUpdater(nullptr),
      m_pUpdateUpdater(nullptr),
      m_messageBoxManager(),
      m_bText(),
      m_procStartUpdateAgent(),
      m_dataManager(),
      m_bRecordingMode(false),
      m_app2AppIP(),
      m_app2AppValues(10),
      m_storesMutex(),
      m_fileSystemWatcher(),
      m_ownSaves()
{
    m_dataManager.acquire(ID(kDataManagerID));
    m_fileSystemWatcher.acquire(ID(kWatcherID));
    trace(L"[ToolConfigurationCommand::ToolConfigurationCommand] : Constructor started");
    createDMData(false);
}

ToolConfigurationCommand::~ToolConfigurationCommand()
{
    trace(L"[ToolConfigurationCommand::~ToolConfigurationCommand] : Destructor started");
    if (unregister(m_ID) != 0)
        warning(L"[ToolConfigurationCommand::~ToolConfigurationCommand] : Failed to unregister for CustomEvent.");

    ACE_Guard<ACE_Thread_Mutex> guard(m_storesMutex);
    delete m_pWorkshopInfoUpdater;
    m_pWorkshopInfoUpdater = nullptr;
    delete m_pUsersUpdater;
    m_pUsersUpdater = nullptr;
    delete m_pUpdateUpdater;
    m_pUpdateUpdater = nullptr;
}

bool ToolConfigurationCommand::init()
{
    trace(L"[ToolConfigurationCommand::init] : Method started");

    if (!m_fileSystemWatcher.isAvailable())
    {
        warning(L"[ToolConfigurationCommand::init()] : Failed to get proxy to Q17FilSystemWatcher.");
        return false;
    }
    if (Register(m_ID) != 0)
    {
        warning(L"[ToolConfigurationCommand::init()] : Failed to register for CustomEvent.");
        return false;
    }

    const ACE_WString usersPath = readPath(kUsersFileDefault, kUsersFileUri);
    const ACE_WString workshopPath = readPath(kWorkshopFileDefault, kWorkshopFileUri);
    m_fileSystemWatcher->addFile(toQString(usersPath));
    m_fileSystemWatcher->addFile(toQString(workshopPath));

    if (!m_messageBoxManager.acquire(ID(kMessageBoxManagerID)))
    {
        trace(L"[ToolConfigurationCommand::init()] Message Box Manager cannot be initialized.");
        return false;
    }
    if (!m_bText.acquire(ID(kBTextID)))
    {
        trace(L"[ToolConfigurationCommand::init()] BText cannot be initialized.");
        return false;
    }
    if (!m_procStartUpdateAgent.acquire(ID(kUpdateAgentID)))
    {
        trace(L"[ToolConfigurationCommand::init()] Cannot get proxy to ProcStartUpdateAgent.");
        return false;
    }

    m_fileSystemWatcher->run(BOStream(true));
    return true;
}

QObject* ToolConfigurationCommand::qObject()
{
    return this;
}

QString ToolConfigurationCommand::trUtf8(const char* sourceText, const char* comment)
{
    return staticMetaObject.tr(sourceText, comment);
}

void ToolConfigurationCommand::customEvent(QEvent*)
{
}

ACE_WString ToolConfigurationCommand::readPath(const wchar_t* defaultPath, const wchar_t* uri)
{
    ACE_WString path(defaultPath);
    if (m_dataManager.isAvailable())
        m_dataManager->getString(ID(uri), path);
    return path;
}

void ToolConfigurationCommand::handleEvent(const CustomEvent& event)
{
    trace(L"[ToolConfigurationCommand::handleEvent(CustomEvent)]: Method started.");
    if (event.get_type() != kFileChangedEvent)
        return;

    ACE_WString changedPath;
    changedPath = event.get_data();

    const ACE_WString usersPath = readPath(kUsersFileDefault, kUsersFileUri);
    const ACE_WString workshopPath = readPath(kWorkshopFileDefault, kWorkshopFileUri);
    ACE_WString updatePath = readPath(kUpdateFileDefault, kUpdateFileUri);
    if (updatePath.is_empty())
        updatePath = kUpdateFileDefault;

    const bool watched = changedPath == workshopPath || changedPath == usersPath || changedPath == updatePath;
    if (watched && m_ownSaves.isOwnSave(WideString::toUtf8(changedPath)))
    {
        trace(L"[ToolConfigurationCommand::handleEvent(CustomEvent)]: Our own save, nothing to rebuild.");
        return;
    }
    if (changedPath == workshopPath)
    {
        createDMData(false);
    }
    else if (changedPath == usersPath)
    {
        createDMData(false);
        refreshUsersListData();
    }
    else if (changedPath == updatePath)
    {
        createDMData(false);
    }
}

void ToolConfigurationCommand::refreshUsersListData()
{
    // The users command publishes the list when it is made.
    const UsersCommand usersCommand(QString("WC_USERSCOMMAND"));
}

void ToolConfigurationCommand::createDMData(bool reset)
{
    trace(L"[ToolConfigurationCommand::createDMData] : Method started");

    // Every store is made afresh from its file, whatever happens to the others: a rebuild (Cancel,
    // a changed file) never keeps an edit that was not saved.
    delete m_pWorkshopInfoUpdater;
    m_pWorkshopInfoUpdater = nullptr;
    m_pWorkshopInfoUpdater = new WorkshopInfoUpdater(readPath(kWorkshopFileDefault, kWorkshopFileUri));
    // A missing workshop file leaves the store loaded and empty (its first save creates the
    // file); only a file that cannot be read stops the publication.
    const bool workshopLoaded = m_pWorkshopInfoUpdater->load() || m_pWorkshopInfoUpdater->isLoaded();

    delete m_pUsersUpdater;
    m_pUsersUpdater = nullptr;
    m_pUsersUpdater = new UsersUpdater(readPath(kUsersFileDefault, kUsersFileUri));
    const bool usersLoaded = m_pUsersUpdater->load();
    m_app2AppValues = BSet(10);
    m_app2AppIP.clear();

    bool updateLoaded = false;
    {
        ACE_Guard<ACE_Thread_Mutex> guard(m_storesMutex);
        delete m_pUpdateUpdater;
        m_pUpdateUpdater = nullptr;

        const ID activeUri = controlUri(ACE_WString(kActivePreparateur));
        ACE_WString activePath;
        if (m_dataManager.isAvailable())
            m_dataManager->getString(activeUri, activePath);
        if (activePath.is_empty() || reset)
        {
            // A reset goes back to the configured file even when the URI is absent.
            activePath.clear();
            if (m_dataManager.isAvailable())
                m_dataManager->getString(ID(kUpdateFileUri), activePath);
            if (activePath.is_empty())
                activePath = kUpdateFileDefault;
            if (m_dataManager.isAvailable())
                m_dataManager->createData(activeUri, BString(activePath));
        }

        m_pUpdateUpdater = new UpdateUpdater(activePath);
        updateLoaded = m_pUpdateUpdater->load();
    }
    if (!workshopLoaded || !usersLoaded || !updateLoaded)
        return;

    createDataForControl(L"ProjectNumberEdit");
    createDataForControl(L"CompanyNameEdit");
    createDataForControl(L"NameEdit");
    createDataForControl(L"StreetEdit");
    createDataForTwoEditControl(L"TownPostCodeEdit");
    createStaticConfigData(ACE_WString(L"data:/Configuration/DoC/SoftInformation/InstallCountry"), L"Country");
    createDataForControl(L"PhoneNumberEdit");
    createDataForControl(L"FaxNumberEdit");
    createDataForCombo(L"BrandCombo");
    createStaticConfigData(ACE_WString(L"data:/Configuration/DoC/SoftInformation/InstallLanguage"), L"Language");
    createStaticConfigData(ACE_WString(L"data:/Configuration/DoC/SoftInformation/Version"),
                           ACE_WString(L"data:/Configuration/DoC/SoftInformation/VersionFormation"), ACE_WString(L" "),
                           L"SerialNo");
    createDataForCheckBox(L"ASRMChk", reset);
    createMarvaneNetData();
    createDataForUUControl(L"App2AppPort");
    createDataForUUControl(L"App2AppIP");
    createDataForUUControl(L"App2AppDealerID");
    ACE_WString app2AppIP;
    m_app2AppValues.getString(L"App2AppIP", app2AppIP);
    m_app2AppIP = app2AppIP;
    createDataForConfigCheckBox(L"CheckInternet");
    createDataForControl(L"DistributionFolderPath");
    createDataForStringControl(L"TaskTimeEdit");
    createDataForUpdateRadioButtons();
}

void ToolConfigurationCommand::createDataForControl(const ACE_WString& name)
{
    trace(L"[ToolConfigurationCommand::createDataForControl] : Method started");
    if (!m_dataManager.isAvailable() || m_pWorkshopInfoUpdater == nullptr || m_pUpdateUpdater == nullptr)
        return;

    ACE_WString text;
    if (name == L"ProjectNumberEdit")
        text = m_pWorkshopInfoUpdater->getBusinessNumber();
    else if (name == L"CompanyNameEdit")
        text = m_pWorkshopInfoUpdater->getCorporateName();
    else if (name == L"NameEdit")
        text = m_pWorkshopInfoUpdater->getName();
    else if (name == L"StreetEdit")
        text = m_pWorkshopInfoUpdater->getRoad();
    else if (name == L"PhoneNumberEdit")
        text = m_pWorkshopInfoUpdater->getTelephone();
    else if (name == L"FaxNumberEdit")
        text = m_pWorkshopInfoUpdater->getFax();
    else if (name == L"DistributionFolderPath")
        text = m_pUpdateUpdater->getDistributionFolderPath();

    m_dataManager->createData(controlUri(name), makeEditRecord(kStateEditable, text));
}

void ToolConfigurationCommand::createDataForUUControl(const ACE_WString& name)
{
    ACE_Guard<ACE_Thread_Mutex> guard(m_storesMutex);
    trace(L"[ToolConfigurationCommand::createDataForUUControl] : Method started");
    if (!m_dataManager.isAvailable() || m_pUsersUpdater == nullptr)
        return;

    ACE_WString text;
    bool known = true;
    if (name == L"App2AppPort")
        text = m_pUsersUpdater->getApp2AppPort();
    else if (name == L"App2AppIP")
        text = m_pUsersUpdater->getApp2AppIP();
    else if (name == L"App2AppDealerID")
        text = m_pUsersUpdater->getApp2AppDealerID();
    else
        known = false;
    if (known)
        m_app2AppValues.setString(name, text);

    m_dataManager->createData(controlUri(name), makeEditRecord(kStateEditable, text));
}

void ToolConfigurationCommand::createDataForTwoEditControl(const ACE_WString& name)
{
    trace(L"[ToolConfigurationCommand::createDataForTwoEditControl] : Method started");
    if (!m_dataManager.isAvailable() || m_pWorkshopInfoUpdater == nullptr)
        return;
    const ACE_WString postalCode = m_pWorkshopInfoUpdater->getPostalCode();
    const ACE_WString town = m_pWorkshopInfoUpdater->getTown();
    m_dataManager->createData(controlUri(name), makeTwoEditRecord(postalCode, town));
}

void ToolConfigurationCommand::createDataForStringControl(const ACE_WString& name)
{
    trace(L"[ToolConfigurationCommand::createDataForStrinControl] : Method started");
    if (!m_dataManager.isAvailable() || m_pUpdateUpdater == nullptr)
        return;
    ACE_WString text;
    if (name == L"TaskTimeEdit")
        text = m_pUpdateUpdater->getTaskTime();
    m_dataManager->createData(controlUri(name), BString(text));
}

void ToolConfigurationCommand::createDataForCheckBox(const ACE_WString& name, bool reset)
{
    trace(L"[ToolConfigurationCommand::createDataForCheckBox] : Method started");
    if (!m_dataManager.isAvailable())
        return;
    const ID uri = controlUri(name);
    bool published = false;
    if (m_dataManager->getBool(uri, published) == 0 && !reset)
        m_bRecordingMode = published;
    m_dataManager->createData(uri, BBool(m_bRecordingMode));
}

void ToolConfigurationCommand::createDataForConfigCheckBox(const ACE_WString& name)
{
    trace(L"[ToolConfigurationCommand::createDataForConfigCheckBox] : Method started");
    if (!m_dataManager.isAvailable())
        return;
    bool checked = false;
    if (m_pUpdateUpdater != nullptr && name == L"CheckInternet")
        checked = m_pUpdateUpdater->getCheckInternet();
    m_dataManager->createData(controlUri(name), BBool(checked));
}

void ToolConfigurationCommand::updateDataForControl(const ACE_WString& name, const ACE_WString& text)
{
    trace(L"[ToolConfigurationCommand::updateDataForControl] : Method started");
    if (!m_dataManager.isAvailable())
        return;
    m_dataManager->setData(controlUri(name), makeEditRecord(kStateEditable, text));
}

void ToolConfigurationCommand::updateDataForControl(const ACE_WString& name, const ACE_WString& text, bool fixed)
{
    trace(L"[ToolConfigurationCommand::updateDataForControl] : Method started");
    if (!m_dataManager.isAvailable())
        return;
    m_dataManager->setData(controlUri(name), makeEditRecord(fixed ? kStateFixed : kStateEditable, text));
}

void ToolConfigurationCommand::updateDataForTwoEditControl(const ACE_WString& name, const ACE_WString& edit1Text,
                                                           const ACE_WString& edit2Text)
{
    trace(L"[ToolConfigurationCommand::updateDataForTwoEditControl] : Method started");
    if (!m_dataManager.isAvailable())
        return;
    m_dataManager->setData(controlUri(name), makeTwoEditRecord(edit1Text, edit2Text));
}

void ToolConfigurationCommand::updateDataForStringControl(const ACE_WString& name, const ACE_WString& text)
{
    trace(L"[ToolConfigurationCommand::updateDataForStringControl] : Method started");
    if (!m_dataManager.isAvailable())
        return;
    m_dataManager->setData(controlUri(name), BString(text));
}

// ---------------------------------------------------------------------------------------------
// Static configuration data and brand list

ACE_WString ToolConfigurationCommand::readConfigString(const ACE_WString& uri)
{
    ACE_WString text;
    if (m_dataManager.isAvailable())
        m_dataManager->getString(ID(uri), text);

    const ACE_WString::size_type hash = text.find(L'#');
    if (hash == ACE_WString::npos)
        return text;
    const ACE_WString textId = text.substring(hash + 1);
    const ACE_WString defaultText = text.substring(0, hash);

    SmartProxy<PBText> bText;
    if (bText.acquire(ID(kBTextID)))
        text = bText->getText(textId, defaultText);
    return text;
}

void ToolConfigurationCommand::publishDisplayOnly(const ACE_WString& name, const ACE_WString& text)
{
    if (!m_dataManager.isAvailable())
        return;
    m_dataManager->createData(controlUri(name), makeEditRecord(kStateDisplayOnly, text));
}

void ToolConfigurationCommand::createStaticConfigData(const ACE_WString& uri, ACE_WString name)
{
    publishDisplayOnly(name, readConfigString(uri));
}

void ToolConfigurationCommand::createStaticConfigData(const ACE_WString& uri1, const ACE_WString& uri2,
                                                      const ACE_WString& separator, ACE_WString name)
{
    ACE_WString text = readConfigString(uri1);
    text += separator;
    text += readConfigString(uri2);
    publishDisplayOnly(name, text);
}

void ToolConfigurationCommand::createStaticFileData(const ACE_WString& section, const ACE_WString& key,
                                                    const ACE_WString& name)
{
    ACE_WString iniPath;
    if (m_dataManager.isAvailable())
        m_dataManager->getString(ID(kIniFileUri), iniPath);

    ACE_WString value;
    {
        CIniFile iniFile;
        if (iniFile.openIniFile(CIniFile::eREAD, iniPath) == 0)
            iniFile.readAttribute(section, key, value);
    }
    publishDisplayOnly(name, value);
}

void ToolConfigurationCommand::createMarvaneNetData()
{
    createStaticFileData(L"TEST", L"Flag_HF", L"HFconnection");
    createStaticFileData(L"TEST", L"NetWork", L"IPaddress");
    createStaticFileData(L"REPROGRAMMATION", L"Nom_Browser1", L"Navigator1");
    createStaticFileData(L"REPROGRAMMATION", L"Nom_Browser2", L"Navigator2");
    createStaticConfigData(ACE_WString(L"data:/Configuration/MenuBar/ToolConfigData/DiagnosticURL"), L"DiagURL");
    createStaticConfigData(ACE_WString(L"data:/Configuration/MenuBar/ToolConfigData/TargetURL"), L"TargetURL");
    createStaticConfigData(ACE_WString(L"data:/Configuration/MenuBar/ToolConfigData/OrbisURL"), L"OrbisURL");
    createStaticConfigData(ACE_WString(L"data:/Configuration/DoC/FicheDiagnostic/FicheDiagServer"), L"FaultServer");
    createStaticConfigData(ACE_WString(L"data:/Configuration/DoC/FicheDiagnostic/SMTPServer"), L"SMTPServer");
}

void ToolConfigurationCommand::createDataForCombo(const ACE_WString& name)
{
    trace(L"[ToolConfigurationCommand::createDataForCombo] : Method started");
    if (!m_dataManager.isAvailable() || m_pWorkshopInfoUpdater == nullptr)
        return;

    // The brand table read in place, once. A key of the full width is its own padded key, and
    // only its value can be a default label: the one of the item with that padded key. A shorter
    // key keeps its own key and value for the default brand's match.
    struct Brand
    {
        ACE_WString padded;
        bool ownPadded;
        // The key is the last keyLength characters of `padded`.
        size_t keyLength;
        // The string value, in `values`.
        size_t valueOffset;
        size_t valueLength;
        // The item's label when it is also this brand's text, else null.
        const ACE_WString* label;
    };
    const ACE_WString storedKey = m_pWorkshopInfoUpdater->getDefaultBrandKey();
    bool storedFound = false;
    // A deque: growing it copies no strings. The values share one buffer.
    std::deque<Brand> brands;
    std::wstring values;
    m_dataManager->visitValues(ID(kBrandsUri), [&](const ACE_WString& key, const BData& value) {
        const bool ownPadded = key.length() >= kBrandKeyWidth;
        const size_t valueOffset = values.size();
        if (value.type() == BData::eSTRING)
        {
            const ACE_WString& text = static_cast<const BString&>(value).value();
            values.append(text.c_str(), text.length());
        }
        brands.push_back({ownPadded ? key : padBrandKey(key), ownPadded, key.length(), valueOffset,
                          values.size() - valueOffset, nullptr});
        storedFound = storedFound || (storedKey.length() != 0 && key == storedKey);
    });
    const auto valueOf = [&values](const Brand& brand) {
        return std::wstring_view(values.data() + brand.valueOffset, brand.valueLength);
    };
    const auto keyOf = [](const Brand& brand) {
        return brand.padded.c_str() + (brand.padded.length() - brand.keyLength);
    };

    SmartProxy<PBText> bText;
    if (!bText.acquire(ID(kBTextID)))
        return;

    // Items in the order of their padded keys; the table is usually in that order already.
    const auto text = [&brands](size_t index) {
        return std::wstring_view(brands[index].padded.c_str(), brands[index].padded.length());
    };
    std::vector<size_t> order(brands.size());
    std::iota(order.begin(), order.end(), size_t(0));
    const auto byPaddedKey = [&text](size_t a, size_t b) { return text(a) < text(b); };
    if (!std::is_sorted(order.begin(), order.end(), byPaddedKey))
        std::sort(order.begin(), order.end(), byPaddedKey);

    auto items = std::make_unique<BSet>(static_cast<int>(brands.size()));
    ACE_WString firstLabel;
    for (size_t first = 0; first < order.size();)
    {
        // Keys that pad alike ("7", "07", "0007") make one item.
        size_t end = first + 1;
        while (end < order.size() && text(order[end]) == text(order[first]))
            ++end;
        ACE_WString defaultLabel;
        for (size_t i = first; i < end; ++i)
            if (brands[order[i]].ownPadded)
            {
                const std::wstring_view value = valueOf(brands[order[i]]);
                defaultLabel = ACE_WString(value.data(), value.size());
            }
        const ACE_WString& paddedKey = brands[order[first]].padded;
        const int number = StringUtilities::toInt(paddedKey.c_str());
        auto label = std::make_unique<BString>(bText->getText(number, defaultLabel));
        if (first == 0)
            firstLabel = label->value();
        // A brand's text is the label when it asks for the same number and either the number has
        // a text (the label is not the default) or its default is the same.
        const bool hasText = label->value() != defaultLabel;
        const std::wstring_view defaultView(defaultLabel.c_str(), defaultLabel.length());
        for (size_t i = first; i < end; ++i)
        {
            Brand& brand = brands[order[i]];
            if (brand.ownPadded ||
                ((hasText || valueOf(brand) == defaultView) && StringUtilities::toInt(keyOf(brand)) == number))
                brand.label = &label->value();
        }
        items->put(paddedKey, std::move(label));
        first = end;
    }

    BSet record(10);
    record.put(L"state", std::make_unique<BInt>(kStateEditable));
    record.put(L"value", std::move(items));

    // The default brand's text, as WorkshopInfoUpdater::getDefaultBrand gives it.
    ACE_WString selected;
    const int storedNumber = storedFound ? StringUtilities::toInt(storedKey.c_str()) : 0;
    if (storedNumber != 0)
        selected = bText->getText(storedNumber, ACE_WString());
    if (selected.is_empty() && !brands.empty())
        selected = firstLabel;
    record.set(L"selected", BString(selected));

    // The first brand in table order whose text is the selected label, else the first brand, as
    // WorkshopInfoUpdater::setDefaultBrand matches it.
    ACE_WString selectedKey;
    for (size_t i = 0; i < brands.size(); ++i)
    {
        const Brand& brand = brands[i];
        bool matches = false;
        if (brand.label != nullptr)
            matches = *brand.label == selected;
        else
        {
            const std::wstring_view value = valueOf(brand);
            matches = bText->getText(StringUtilities::toInt(keyOf(brand)), ACE_WString(value.data(), value.size())) ==
                      selected;
        }
        if (i == 0 || matches)
            selectedKey = keyOf(brand);
        if (matches)
            break;
    }
    m_pWorkshopInfoUpdater->setDefaultBrandKey(selectedKey);
    m_dataManager->createData(controlUri(name), std::move(record));
}

void ToolConfigurationCommand::createDataForUpdateRadioButtons()
{
    trace(L"[ToolConfigurationCommand::createDataForUpdateRadioButtons] : Method started");
    if (!m_dataManager.isAvailable() || m_pUpdateUpdater == nullptr)
        return;

    const ACE_WString mode = m_pUpdateUpdater->getDeploymentMode();
    if (mode == kModeLocal)
    {
        setRadioButtonState(L"LocalRadioButton", true);
        setRadioButtonState(L"A2ARadioButton", false);
        setRadioButtonState(L"OtherRadioButton", false);
        updateDataForControl(kDistributionFolder, m_pUpdateUpdater->getLocalDistributionFolderPath(), true);
    }
    else if (mode == kModeA2A)
    {
        setRadioButtonState(L"LocalRadioButton", false);
        setRadioButtonState(L"A2ARadioButton", true);
        setRadioButtonState(L"OtherRadioButton", false);
        updateDataForControl(kDistributionFolder, app2AppSharePath(m_app2AppIP), true);
    }
    else if (mode == kModeOther)
    {
        setRadioButtonState(L"LocalRadioButton", false);
        setRadioButtonState(L"A2ARadioButton", false);
        setRadioButtonState(L"OtherRadioButton", true);
        updateDataForControl(kDistributionFolder, m_pUpdateUpdater->getDistributionFolderPath(), false);
    }
    // Any other mode leaves the radio buttons and the folder record as they are.
}

void ToolConfigurationCommand::setRadioButtonState(ACE_WString name, bool state)
{
    if (!m_dataManager.isAvailable())
        return;
    m_dataManager->createData(controlUri(name), BBool(state));
}

void ToolConfigurationCommand::validateIP(ACE_WString& ip)
{
    normaliseDottedAddress(ip);
}

// ---------------------------------------------------------------------------------------------
// Workshop and App2App field slots

void ToolConfigurationCommand::onProjectNumberChanged(QString qstrValue)
{
    trace(L"[ToolConfigurationCommand::onProjectNumberChanged] : Method started");
    if (m_pWorkshopInfoUpdater == nullptr || !m_dataManager.isAvailable())
        return;
    const ACE_WString text = toWide(qstrValue);
    updateDataForControl(L"ProjectNumberEdit", text);
    m_pWorkshopInfoUpdater->setBusinessNumber(text);
}

void ToolConfigurationCommand::onCompanyNameChanged(QString qstrValue)
{
    trace(L"[ToolConfigurationCommand::onCompanyNameChanged] : Method started");
    if (m_pWorkshopInfoUpdater == nullptr || !m_dataManager.isAvailable())
        return;
    const ACE_WString text = toWide(qstrValue);
    updateDataForControl(L"CompanyNameEdit", text);
    m_pWorkshopInfoUpdater->setCorporateName(text);
}

void ToolConfigurationCommand::onNameChanged(QString qstrValue)
{
    trace(L"[ToolConfigurationCommand::onNameChanged] : Method started");
    if (m_pWorkshopInfoUpdater == nullptr || !m_dataManager.isAvailable())
        return;
    const ACE_WString text = toWide(qstrValue);
    updateDataForControl(L"NameEdit", text);
    m_pWorkshopInfoUpdater->setName(text);
}

void ToolConfigurationCommand::onStreetChanged(QString qstrValue)
{
    trace(L"[ToolConfigurationCommand::onStreetChanged] : Method started");
    if (m_pWorkshopInfoUpdater == nullptr || !m_dataManager.isAvailable())
        return;
    const ACE_WString text = toWide(qstrValue);
    updateDataForControl(L"StreetEdit", text);
    m_pWorkshopInfoUpdater->setRoad(text);
}

void ToolConfigurationCommand::onTownOrPostCodeChanged(QString qstrPostcode, QString qstrTown)
{
    trace(L"[ToolConfigurationCommand::onTownOrPostCodeChanged] : Method started");
    if (m_pWorkshopInfoUpdater == nullptr || !m_dataManager.isAvailable())
        return;
    const ACE_WString postalCode = toWide(qstrPostcode);
    const ACE_WString town = toWide(qstrTown);
    updateDataForTwoEditControl(L"TownPostCodeEdit", postalCode, town);
    m_pWorkshopInfoUpdater->setTown(town);
    m_pWorkshopInfoUpdater->setPostalCode(postalCode);
}

void ToolConfigurationCommand::onPhoneNumberChanged(QString qstrValue)
{
    trace(L"[ToolConfigurationCommand::onPhoneNumberChanged] : Method started");
    if (m_pWorkshopInfoUpdater == nullptr || !m_dataManager.isAvailable())
        return;
    const ACE_WString text = toWide(qstrValue);
    updateDataForControl(L"PhoneNumberEdit", text);
    m_pWorkshopInfoUpdater->setTelephone(text);
}

void ToolConfigurationCommand::onFaxNumberChanged(QString qstrValue)
{
    trace(L"[ToolConfigurationCommand::onFaxNumberChanged] : Method started");
    if (m_pWorkshopInfoUpdater == nullptr || !m_dataManager.isAvailable())
        return;
    const ACE_WString text = toWide(qstrValue);
    updateDataForControl(L"FaxNumberEdit", text);
    m_pWorkshopInfoUpdater->setFax(text);
}

void ToolConfigurationCommand::onManufacturerChanged(QString qstrValue)
{
    trace(L"[ToolConfigurationCommand::onManufacturerChanged] : Method started");
    if (m_pWorkshopInfoUpdater == nullptr || !m_dataManager.isAvailable())
        return;
    m_pWorkshopInfoUpdater->setDefaultBrand(toWide(qstrValue));
}

void ToolConfigurationCommand::onPortChanged(QString qstrValue)
{
    trace(L"[ToolConfigurationCommand::onPortChanged] : Method started");
    if (!m_dataManager.isAvailable())
        return;
    const ACE_WString text = toWide(qstrValue);
    updateDataForControl(L"App2AppPort", text);
    m_app2AppValues.setString(L"App2AppPort", text);
}

void ToolConfigurationCommand::onIPAddressChanged(QString qstrValue)
{
    trace(L"[ToolConfigurationCommand::onIPAddressChanged] : Method started");
    if (!m_dataManager.isAvailable())
        return;
    const ACE_WString text = toWide(qstrValue);
    updateDataForControl(L"App2AppIP", text);
    m_app2AppValues.setString(L"App2AppIP", text);
}

void ToolConfigurationCommand::onDealerIDChanged(QString qstrValue)
{
    trace(L"[ToolConfigurationCommand::onDealerIDChanged] : Method started");
    if (!m_dataManager.isAvailable())
        return;
    const ACE_WString text = toWide(qstrValue);
    updateDataForControl(L"App2AppDealerID", text);
    m_app2AppValues.setString(L"App2AppDealerID", text);
}

void ToolConfigurationCommand::onButtonSaveLogsClicked()
{
    CLogsZipperGui::zipLogsWithGui();
}

// ---------------------------------------------------------------------------------------------
// Update-mode, scheduling, OK and Cancel slots: their behaviour comes with the update-mode and
// commit work; until then each only writes its entry line.

void ToolConfigurationCommand::onRecordingModeChecked(bool bChecked)
{
    trace(L"[ToolConfigurationCommand::onRecordingModeChecked] : Method started");
    if (!m_dataManager.isAvailable())
        return;
    const ID uri = controlUri(ACE_WString(L"ASRMChk"));
    // Keeps the value from before this change.
    m_dataManager->getBool(uri, m_bRecordingMode);
    m_dataManager->setData(uri, BBool(bChecked));
}

void ToolConfigurationCommand::onOKButtonClicked()
{
    trace(L"[ToolConfigurationCommand::onOKButtonClicked] : Method started");

    if (m_dataManager.isAvailable())
        m_dataManager->getBool(controlUri(L"ASRMChk"), m_bRecordingMode);
    TesselLog_Static::setLevel_static(m_bRecordingMode ? 10 : 0);

    // A saved file is never empty (it holds at least its root element), so empty means not saved.
    std::string workshopWritten;
    if (m_pWorkshopInfoUpdater != nullptr && !m_pWorkshopInfoUpdater->save(workshopWritten))
        warning(L"[ToolConfigurationCommand::onOKButtonClicked] : Cannot save workshop data!");

    std::string usersWritten;
    if (m_dataManager.isAvailable())
        saveUsersAndApp2App(usersWritten);

    std::string updateWritten;
    if (m_pUpdateUpdater != nullptr)
        saveOnlineUpdateAndTask(updateWritten);

    ACE_WString updatePath = readPath(kUpdateFileDefault, kUpdateFileUri);
    if (updatePath.is_empty())
        updatePath = kUpdateFileDefault;
    const std::pair<ACE_WString, const std::string*> saves[] = {
        {readPath(kWorkshopFileDefault, kWorkshopFileUri), &workshopWritten},
        {readPath(kUsersFileDefault, kUsersFileUri), &usersWritten},
        {updatePath, &updateWritten}};
    for (const auto& save : saves)
    {
        // The fingerprint comes from the bytes just written; a file not saved is read as it is.
        const std::string path = WideString::toUtf8(save.first);
        if (save.second->empty())
            m_ownSaves.remember(path);
        else
            m_ownSaves.remember(path, *save.second);
    }

    SmartProxy<PMediator> mediator;
    if (mediator.acquire(ID(kMediatorID)))
        mediator->closeDialog();
}

void ToolConfigurationCommand::onCancelButtonClicked()
{
    SmartProxy<PMediator> mediator;
    if (mediator.acquire(ID(kMediatorID)))
        mediator->closeDialog();

    createDMData(true);
    refreshUsersListData();
    mediator.giveBack();
}

void ToolConfigurationCommand::onFolderBrowserButtonClicked()
{
    trace(L"[ToolConfigurationCommand::onFolderBrowserButtonClicked] : Method started");
    const QString chosen = chooseDirectory();
    if (m_pUpdateUpdater == nullptr || !m_dataManager.isAvailable())
        return;
    const ACE_WString path = toWide(chosen);
    if (path.is_empty())
        return;
    updateDataForControl(kDistributionFolder, path);
    m_pUpdateUpdater->setDistributionFolderPath(path);
}

void ToolConfigurationCommand::onCheckInternetChecked(bool bChecked)
{
    trace(L"[ToolConfigurationCommand::onCheckInternetChecked] : Method started");
    if (m_pUpdateUpdater == nullptr || !m_dataManager.isAvailable())
        return;
    m_pUpdateUpdater->setCheckInternet(bChecked);
    m_dataManager->setData(controlUri(ACE_WString(L"CheckInternet")), BBool(bChecked));
}

void ToolConfigurationCommand::onLocalRadioButtonClicked()
{
    trace(L"[ToolConfigurationCommand::onLocalRadioButtonClicked] : Method started");
    if (m_pUpdateUpdater == nullptr || !m_dataManager.isAvailable())
        return;
    m_pUpdateUpdater->setDeploymentMode(kModeLocal);
    setRadioButtonState(L"LocalRadioButton", true);
    setRadioButtonState(L"A2ARadioButton", false);
    setRadioButtonState(L"OtherRadioButton", false);
    updateDataForControl(kDistributionFolder, m_pUpdateUpdater->getLocalDistributionFolderPath(), true);
}

void ToolConfigurationCommand::onA2ARadioButtonClicked()
{
    trace(L"[ToolConfigurationCommand::onA2ARadioButtonClicked] : Method started");
    if (m_pUpdateUpdater == nullptr || !m_dataManager.isAvailable())
        return;
    m_pUpdateUpdater->setDeploymentMode(kModeA2A);
    setRadioButtonState(L"LocalRadioButton", false);
    setRadioButtonState(L"A2ARadioButton", true);
    setRadioButtonState(L"OtherRadioButton", false);
    const ACE_WString sharePath = app2AppSharePath(m_app2AppIP);
    updateDataForControl(kDistributionFolder, sharePath, true);
    m_pUpdateUpdater->setDistributionFolderPath(sharePath);
}

void ToolConfigurationCommand::onOtherRadioButtonClicked()
{
    trace(L"[ToolConfigurationCommand::onOtherRadioButtonClicked] : Method started");
    if (m_pUpdateUpdater == nullptr || !m_dataManager.isAvailable())
        return;
    m_pUpdateUpdater->setDeploymentMode(kModeOther);
    setRadioButtonState(L"LocalRadioButton", false);
    setRadioButtonState(L"A2ARadioButton", false);
    setRadioButtonState(L"OtherRadioButton", true);
    updateDataForControl(kDistributionFolder, m_pUpdateUpdater->getDistributionFolderPath(), false);
}

void ToolConfigurationCommand::onDistributionFolderPathChanged(QString qstrValue)
{
    trace(L"[ToolConfigurationCommand::onDistributionFolderPathChanged] : Method started");
    if (m_pUpdateUpdater == nullptr || !m_dataManager.isAvailable())
        return;
    const ACE_WString text = toWide(qstrValue);
    updateDataForControl(kDistributionFolder, text);
    m_pUpdateUpdater->setDistributionFolderPath(text);
}

void ToolConfigurationCommand::onTaskTimeEditChanged(const QTime& taksTime)
{
    trace(L"[ToolConfigurationCommand::onTaskTimeEditChanged] : Method started");
    // hh:mm:ss; an invalid time gives the empty text.
    const ACE_WString text = toWide(taksTime.toString(Qt::TextDate));
    if (m_pUpdateUpdater != nullptr)
        m_pUpdateUpdater->setTaskTime(text);
    if (m_dataManager.isAvailable())
        m_dataManager->setData(ID(kTaskTimeUri), BString(text));
}

void ToolConfigurationCommand::onConfigurationTestButtonClicked()
{
    trace(L"[ToolConfigurationCommand::onConfigurationTestButtonClicked] : Method started");
    ACE_WString tmpPath(kUpdateTmpFileDefault);
    if (m_dataManager.isAvailable())
    {
        m_dataManager->getString(ID(kUpdateTmpFileUri), tmpPath);
        if (tmpPath.is_empty())
            tmpPath = kUpdateTmpFileDefault;
    }
    if (m_pUpdateUpdater != nullptr)
        m_pUpdateUpdater->save(tmpPath);
    if (m_dataManager.isAvailable())
        m_dataManager->setString(controlUri(ACE_WString(kActivePreparateur)), tmpPath);

    OnLineUpdateCommand onLineUpdateCommand(QStringLiteral("WC_ONLINEUPDATECOMMAND"));
    onLineUpdateCommand.init();
}

// ---------------------------------------------------------------------------------------------
// OK helpers

void ToolConfigurationCommand::saveUsersAndApp2App(std::string& written)
{
    written.clear();
    ACE_Guard<ACE_Thread_Mutex> guard(m_storesMutex);

    // The published users' texts, read in place: a set's key and its three strings.
    struct PublishedUser
    {
        ACE_WString key;
        ACE_WString name;
        ACE_WString address;
        ACE_WString phone;
    };
    // A deque: growing it copies no strings.
    std::deque<PublishedUser> published;
    int entries = 0;
    m_dataManager->visitNestedValues(
        ID(kUserSetUri), entries, [&published](const ACE_WString& setKey, const ACE_WString& key, const BData& value) {
            if (published.empty() || published.back().key != setKey)
                published.push_back(PublishedUser{setKey, ACE_WString(), ACE_WString(), ACE_WString()});
            if (value.type() != BData::eSTRING)
                return;
            PublishedUser& user = published.back();
            ACE_WString* field = key == L"name"      ? &user.name
                                 : key == L"address" ? &user.address
                                 : key == L"phone"   ? &user.phone
                                                     : nullptr;
            if (field != nullptr)
                *field = static_cast<const BString&>(value).value();
        });
    if (m_pUsersUpdater == nullptr)
        return;

    m_pUsersUpdater->removeAllUsers();
    const PublishedUser empty;
    for (int i = 0; i < entries; ++i)
    {
        // A missing entry or one of another kind gives an empty user. Entries are usually in
        // order, so slot i is tried first.
        const ACE_WString key = userKey(i);
        const PublishedUser* user = &empty;
        if (static_cast<std::size_t>(i) < published.size() && published[i].key == key)
            user = &published[i];
        else
            for (const PublishedUser& candidate : published)
                if (candidate.key == key)
                    user = &candidate;
        m_pUsersUpdater->addUser(user->name, user->address, user->phone);
    }

    // A value the dialog never showed keeps what the file holds.
    ACE_WString port = m_pUsersUpdater->getApp2AppPort();
    ACE_WString ip = m_pUsersUpdater->getApp2AppIP();
    ACE_WString dealerId = m_pUsersUpdater->getApp2AppDealerID();
    m_app2AppValues.getString(L"App2AppPort", port);
    m_app2AppValues.getString(L"App2AppDealerID", dealerId);
    if (m_app2AppValues.getString(L"App2AppIP", ip) == 0)
    {
        const ACE_WString typedIp = ip;
        validateIP(ip);
        if (ip != typedIp)
            updateDataForControl(L"App2AppIP", ip);
    }

    m_pUsersUpdater->setApp2AppParams(port, ip, dealerId);
    if (!m_pUsersUpdater->save(written))
        warning(L"[ToolConfigurationCommand::onOKButtonClicked] : Cannot save users data!");
}

void ToolConfigurationCommand::saveOnlineUpdateAndTask(std::string& written)
{
    written.clear();
    std::unique_ptr<OnLineUpdateCommand> onLineUpdate;
    {
        ACE_Guard<ACE_Thread_Mutex> guard(m_storesMutex);

        ACE_WString path;
        if (m_dataManager.isAvailable())
            m_dataManager->getString(ID(kUpdateFileUri), path);
        if (path.is_empty())
            path = kUpdateFileDefault;
        if (!m_pUpdateUpdater->save(path, written))
            warning(L"[ToolConfigurationCommand::onOKButtonClicked] : Cannot save Preparateur data!");
        else if (m_dataManager.isAvailable())
            // A configuration test left the active path on its temporary copy; the saved file
            // is what a later rebuild must read.
            m_dataManager->setString(controlUri(ACE_WString(kActivePreparateur)), path);

        // Without its settings the online-update switch is unknown: the flag and the task stay.
        if (!m_pUpdateUpdater->isLoaded())
            return;

        onLineUpdate = std::make_unique<OnLineUpdateCommand>(QString("WC_TOOLCONFIGURATION"));
        const bool enabled = m_pUpdateUpdater->getCheckInternet();
        if (m_dataManager.isAvailable())
            m_dataManager->setBool(ID(kEnableOnlineUpdateUri), enabled);

        if (enabled)
        {
            if (!onLineUpdate->CreateScheduledTask())
                warning(L"[ToolConfigurationCommand::onOKButtonClicked] : The scheduller task for starting of the "
                        L"Preparateur module has not been created!");
        }
        else if (!onLineUpdate->DeleteScheduledTask())
        {
            warning(L"[ToolConfigurationCommand::onOKButtonClicked] : The scheduller task for starting of the "
                    L"Preparateur module has not been deleted!");
        }
    }
    // The command goes only once the lock is released.
    onLineUpdate.reset();
}
