#include "BenchSetup.h"

#include "BEvent.h"
#include "BString.h"
#include "CBText.h"
#include "CDataManager.h"
#include "CMediator.h"
#include "CMessageBoxManager.h"
#include "CProcStartUpdateAgent.h"
#include "CQ17FileSystemWatcher.h"
#include "CToolConfigControllersFactory.h"
#include "ComponentManagerFactory.h"
#include "CustomEvent.h"
#include "IComponentManager.h"
#include "TaskSchedulerSettings.h"
#include "TesselLog_Static.h"
#include "ToolConfigurationCommand.h"
#include "WideString.h"

#include <ace/Thread_Manager.h>

#include <cstdlib>
#include <fstream>
#include <map>
#include <sstream>

#include <fcntl.h>
#include <unistd.h>

namespace
{
const wchar_t* const kWorkshopFileUri = L"data:/Configuration/MenuBar/WorkshopFile";
const wchar_t* const kUsersFileUri = L"data:/Configuration/DoC/FicheDiagnostic/FicheDiagParamsFileName";
const wchar_t* const kUpdateFileUri = L"data:/Configuration/MenuBar/PreparateurConfigFile";
const wchar_t* const kUpdateTmpFileUri = L"data:/Configuration/MenuBar/PreparateurConfigFileTmp";
const wchar_t* const kBrandsUri = L"data:/Configuration/DoC/Config_Accueil/Brands";
const int kFileChangedEvent = 668;

ACE_WString w(const std::string& text)
{
    return WideString::fromUtf8(text);
}

std::string readAll(const std::string& path)
{
    std::ifstream in(path, std::ios::binary);
    std::stringstream buffer;
    buffer << in.rdbuf();
    return buffer.str();
}

struct StringWriter : pugi::xml_writer
{
    void write(const void* data, size_t size) override { text.append(static_cast<const char*>(data), size); }
    std::string text;
};

std::string serialise(const pugi::xml_document& document)
{
    StringWriter writer;
    document.save(writer, "", pugi::format_raw, pugi::encoding_utf8);
    return writer.text;
}

// The durable write a save does: temporary file, sync, rename, sync of the folder.
void writeDurably(const std::string& path, const std::string& bytes)
{
    std::string temporary = path + ".lbXXXXXX";
    const int file = ::mkstemp(temporary.data());
    if (file < 0)
        std::abort();
    bool written = ::write(file, bytes.data(), bytes.size()) == static_cast<ssize_t>(bytes.size());
    written = ::fsync(file) == 0 && written;
    ::close(file);
    if (!written || ::rename(temporary.c_str(), path.c_str()) != 0)
        std::abort();
    const int folder = ::open(std::filesystem::path(path).parent_path().c_str(), O_RDONLY | O_DIRECTORY);
    if (folder >= 0)
    {
        ::fsync(folder);
        ::close(folder);
    }
}

void flatten(const BSet& set, const std::wstring& prefix, std::vector<std::pair<std::wstring, std::wstring>>& out)
{
    for (int i = 0; i < set.size(); ++i)
    {
        const std::wstring key = prefix + L"/" + WideString::toStd(set.keyAt(i));
        const BData& value = set.valueAt(i);
        if (value.type() == BData::eSET)
            flatten(static_cast<const BSet&>(value), key, out);
        else if (value.type() == BData::eSTRING)
            out.emplace_back(key, WideString::toStd(static_cast<const BString&>(value).value()));
        else
            out.emplace_back(key, std::wstring());
    }
}

void parseFile(const std::string& path, pugi::xml_document& document)
{
    const std::string bytes = readAll(path);
    if (!document.load_buffer(bytes.data(), bytes.size()))
        std::abort();
}
}

BenchSetup::BenchSetup(int brands) : m_typed(10)
{
    std::string pattern = (std::filesystem::temp_directory_path() / "ptc-bench-XXXXXX").string();
    m_dir = ::mkdtemp(pattern.data());
    std::filesystem::create_directories(m_dir / "Data/User/OnLineUpdate");
    std::filesystem::create_directories(m_dir / "Tasks");

    m_manager = ComponentManagerFactory::getComponentManager();
    m_dataManager = CDataManager::registerWith(*m_manager);
    CDataManager* dataManager = m_dataManager;
    CBText* text = CBText::registerWith(*m_manager);
    CProcStartUpdateAgent* agent = CProcStartUpdateAgent::registerWith(*m_manager);
    if (dataManager == nullptr || text == nullptr || agent == nullptr ||
        CQ17FileSystemWatcher::registerWith(*m_manager) == nullptr ||
        CMessageBoxManager::registerWith(*m_manager) == nullptr || CMediator::registerWith(*m_manager) == nullptr)
        std::abort();
    agent->setTestAnswer(0, 0);
    TaskSchedulerSettings::setTasksFolder((m_dir / "Tasks").string());
    TaskSchedulerSettings::setServiceState(0);

    dataManager->createData(ID(kWorkshopFileUri), BString(w(path(File::Workshop))));
    dataManager->createData(ID(kUsersFileUri), BString(w(path(File::Users))));
    dataManager->createData(ID(kUpdateFileUri), BString(w(path(File::Update))));
    dataManager->createData(ID(kUpdateTmpFileUri),
                            BString(w((m_dir / "Data/User/OnLineUpdate/PreparateurTmp.xml").string())));
    BSet brandSet(10);
    for (int n = 1; n <= brands; ++n)
    {
        const ACE_WString key = w(std::to_string(n));
        brandSet.setString(key, w("Brand " + std::to_string(n)));
        text->setText(key, w("Marque n°" + std::to_string(n)));
    }
    dataManager->createData(ID(kBrandsUri), brandSet);
    writeFiles(brands);

    TesselLog_Static::setLogFile(w((m_dir / "bench.log").string()));
    TesselLog_Static::setLevel_static(0);

    m_factory =
        std::make_unique<CToolConfigControllersFactory>(ID(L"proc:ProcToolConfiguration?ToolConfigControllersFactory"));
    collectPublishedRecords();
}

BenchSetup::~BenchSetup()
{
    m_users.reset();
    m_toolConfiguration.reset();
    m_factory.reset();
    ACE_Thread_Manager::instance()->wait();
    TesselLog_Static::setLogFile(ACE_WString());
    m_manager->destroyAllComponents();
    m_manager->release();
    TaskSchedulerSettings::setTasksFolder(std::string());
    std::error_code ignored;
    std::filesystem::remove_all(m_dir, ignored);
}

std::string BenchSetup::path(File file) const
{
    switch (file)
    {
    case File::Workshop:
        return (m_dir / "Data/User/InformationsGarage.xml").string();
    case File::Users:
        return (m_dir / "Data/User/FicheDiagParams.xml").string();
    case File::Update:
        break;
    }
    return (m_dir / "Data/User/OnLineUpdate/Preparateur.xml").string();
}

void BenchSetup::writeFiles(int brands)
{
    BSet workshop(10);
    workshop.setString(w("numero_affaire"), w("0690042"));
    workshop.setString(w("raison_sociale"), w("Garage de la Croix-Rousse SARL"));
    workshop.setString(w("nom"), w("Garage Lefèvre & Fils"));
    workshop.setString(w("rue"), w("12 boulevard des Canuts"));
    workshop.setString(w("ville"), w("Lyon"));
    workshop.setString(w("codepostal"), w("69004"));
    workshop.setString(w("telephone"), w("+33 4 78 28 00 00"));
    workshop.setString(w("telecopie"), w("+33 4 78 28 00 01"));
    workshop.setString(w("default_brand"), w(std::to_string(brands / 2 + 1)));
    workshop.setBool(w("new_docuvia_mode"), true);
    BSet idp(10);
    idp.setString(w("issuer"), w("https://idp.example/realms/workshops"));
    idp.setString(w("clientId"), w("workshop-diagnostic"));
    idp.setString(w("redirectUri"), w("http://localhost:8765/callback"));
    idp.setString(w("scope"), w("openid profile workshop"));
    idp.setInt(w("tokenLifetime"), 3600);
    workshop.setSet(w("IDP_Infos"), idp);

    BSet users(10);
    const char* names[] = {"Łukasz Żółć", "王小明", "Anne-Sophie Lefèvre", "Jürgen Groß", "Ørjan Ærø"};
    for (int n = 1; n <= 20; ++n)
    {
        BSet user(10);
        user.setString(w("name"), w(std::string(names[n % 5]) + " " + std::to_string(n)));
        user.setString(w("address"), w(std::to_string(n) + " rue de la République, 69002 Lyon"));
        user.setString(w("telephone"), w("+33 4 78 00 00 " + std::to_string(10 + n)));
        users.setSet(w("user" + std::to_string(n)), user);
    }
    BSet attributes(10);
    attributes.setString(w("application"), w("vexa"));
    attributes.setString(w("service"), w("sfd"));
    attributes.setString(w("dealerId"), w("FR-069-00042"));
    BSet app2App(10);
    app2App.setString(w("Port"), w("8443"));
    app2App.setString(w("IP"), w("192.168.10.20"));
    app2App.setInt(w("NumRetries"), 3);
    app2App.setDouble(w("Timeout"), 3.0);
    app2App.setSet(w("RequestAttributes"), attributes);
    BSet content(10);
    content.setString(w("activation"), w("1"));
    content.setSet(w("users"), users);
    content.setSet(w("App2App"), app2App);

    BSet update(10);
    update.setBool(w("OnlineUpdateActivated"), false);
    update.setString(w("DeploymentMode"), w("LOCAL"));
    update.setString(w("DistributionFolderPath"), w("\\\\serveur-atelier\\distribution\\paquets"));
    update.setString(w("LocalDistributionFolderPath"), w((m_dir / "repository").string()));
    update.setString(w("FeedbackFolderPath"), w((m_dir / "repository/Feedback").string()));
    update.setString(w("UpdateRetrievalTime"), w("11:00:00"));
    update.setInt(w("ErrorCounter"), 2);
    update.setInt(w("MaxLogsNumber"), 10);
    update.setBool(w("LogDebug"), false);

    if (!workshop.save(w(path(File::Workshop)), false) || !content.save(w(path(File::Users)), false) ||
        !update.save(w(path(File::Update)), false))
        std::abort();
}

void BenchSetup::collectPublishedRecords()
{
    openKept();
    ok();
    for (int i = 0; i < 3; ++i)
        parseFile(path(static_cast<File>(i)), m_saved[i]);
    BSet published(10);
    m_dataManager->getData(ID(L"data:/Auto"), published);
    flatten(published, L"data:/Auto", m_published);
    m_users.reset();
    m_toolConfiguration.reset();
}

void BenchSetup::openKept()
{
    m_users.reset();
    m_toolConfiguration.reset();
    m_toolConfiguration.reset(m_factory->getControllerByName(ACE_WString(L"WC_TOOLCONFIGURATION")));
    if (m_toolConfiguration == nullptr || !m_toolConfiguration->init())
        std::abort();
    m_users.reset(m_factory->getControllerByName(ACE_WString(L"WC_USERSCOMMAND")));
    if (m_users == nullptr || !m_users->init())
        std::abort();
}

void BenchSetup::openAndClose()
{
    openKept();
    m_users.reset();
    m_toolConfiguration.reset();
}

void BenchSetup::cancel()
{
    static_cast<ToolConfigurationCommand&>(*m_toolConfiguration).onCancelButtonClicked();
}

void BenchSetup::ok()
{
    static_cast<ToolConfigurationCommand&>(*m_toolConfiguration).onOKButtonClicked();
}

void BenchSetup::fileChanged(File file)
{
    BEvent<CustomEvent>::post(ToolConfigurationCommand::m_ID, CustomEvent(kFileChangedEvent, w(path(file))));
}

void BenchSetup::parseAndPublishLowerBound()
{
    pugi::xml_document documents[3];
    for (int i = 0; i < 3; ++i)
        parseFile(path(static_cast<File>(i)), documents[i]);
    std::map<std::wstring, std::wstring> records;
    for (const auto& [key, text] : m_published)
        records[key] = text;
    if (records.size() != m_published.size())
        std::abort();
}

void BenchSetup::serialiseLowerBound(bool io)
{
    for (int i = 0; i < 3; ++i)
    {
        const std::string bytes = serialise(m_saved[i]);
        if (io)
            writeDurably(path(static_cast<File>(i)) + ".lowerbound", bytes);
        else if (bytes.empty())
            std::abort();
    }
}

void BenchSetup::writeTypedValueFile(int kib)
{
    m_typedPath = (m_dir / "typed.xml").string();
    m_typedCopyPath = (m_dir / "typed-copy.xml").string();
    const auto entry = [](int n) {
        BSet address(10);
        address.setString(w("street"), w(std::to_string(n) + " rue de la République"));
        address.setString(w("town"), w("Lyon – Presqu'île"));
        BSet item(10);
        item.setString(w("name"), w("Jürgen Groß " + std::to_string(n)));
        item.setInt(w("count"), n * 37);
        item.setBool(w("enabled"), n % 2 == 0);
        item.setDouble(w("ratio"), n / 7.0);
        item.setSet(w("address"), address);
        return item;
    };
    // Ten entries give the size of one; then as many as the size asks for.
    BSet sample(10);
    for (int n = 0; n < 10; ++n)
        sample.setSet(w("entry" + std::to_string(n)), entry(n));
    if (!sample.save(w(m_typedPath), false))
        std::abort();
    const auto perEntry = std::filesystem::file_size(m_typedPath) / 10;
    const auto count = static_cast<int>(static_cast<std::uintmax_t>(kib) * 1024 / perEntry);
    BSet set(10);
    for (int n = 0; n < count; ++n)
        set.setSet(w("entry" + std::to_string(n)), entry(n));
    if (!set.save(w(m_typedPath), false))
        std::abort();
    parseFile(m_typedPath, m_typedDocument);
}

void BenchSetup::loadTypedValueFile()
{
    BSet set(10);
    if (!set.load(w(m_typedPath)))
        std::abort();
    m_typed = std::move(set);
}

void BenchSetup::saveTypedValueFile()
{
    if (!m_typed.save(w(m_typedCopyPath), false))
        std::abort();
}

void BenchSetup::parseTypedValueFileLowerBound()
{
    pugi::xml_document document;
    parseFile(m_typedPath, document);
}

void BenchSetup::serialiseTypedValueFileLowerBound()
{
    writeDurably(m_typedCopyPath, serialise(m_typedDocument));
}
