#include "WorkshopInfoUpdater.h"

#include "BString.h"
#include "CWin32FileUtilities.h"
#include "ID.h"
#include "PBText.h"
#include "PDataManager.h"
#include "SmartProxy.h"
#include "StringUtilities.h"
#include "TesselLog_Static.h"
#include "Win32File.h"

namespace
{
const char* const kComponent = "ProcToolConfiguration";
const char* const kFile = "ProcToolConfiguration.dll";
const char* const kClass = "WorkshopInfoUpdater";

const wchar_t* const kBusinessNumber = L"numero_affaire";
const wchar_t* const kCorporateName = L"raison_sociale";
const wchar_t* const kName = L"nom";
const wchar_t* const kRoad = L"rue";
const wchar_t* const kTown = L"ville";
const wchar_t* const kPostalCode = L"codepostal";
const wchar_t* const kTelephone = L"telephone";
const wchar_t* const kFax = L"telecopie";
const wchar_t* const kDefaultBrand = L"default_brand";
const wchar_t* const kNewDocuviaMode = L"new_docuvia_mode";
const wchar_t* const kIDPInfos = L"IDP_Infos";

const wchar_t* const kTextComponentID = L"tessel:BText?BText";
const wchar_t* const kDataManagerID = L"tessel:DM?DataManager";
const wchar_t* const kBrandsURI = L"data:/Configuration/DoC/Config_Accueil/Brands";

void warn(const ACE_WString& message)
{
    TesselLog_Static::logWarning_static(kComponent, kFile, kClass, message.c_str());
}

// The text component and the data manager's brand table, read in place, for one call.
class BrandLookup
{
public:
    BrandLookup() { m_available = m_text.acquire(ID(kTextComponentID)) && m_dataManager.acquire(ID(kDataManagerID)); }

    bool isAvailable() const { return m_available; }

    bool contains(const ACE_WString& key)
    {
        bool found = false;
        m_dataManager->visitValues(ID(kBrandsURI),
                                   [&](const ACE_WString& brand, const BData&) { found = found || brand == key; });
        return found;
    }

    // The first brand whose text is `label`; without one, false and the first brand (if any).
    bool keyOf(const ACE_WString& label, ACE_WString& key)
    {
        bool found = false;
        bool first = true;
        m_dataManager->visitValues(ID(kBrandsURI), [&](const ACE_WString& brand, const BData& value) {
            if (found)
                return;
            if (first)
                key = brand;
            first = false;
            const ACE_WString defaultName =
                value.type() == BData::eSTRING ? static_cast<const BString&>(value).value() : ACE_WString();
            if (text(StringUtilities::toInt(brand.c_str()), defaultName) == label)
            {
                key = brand;
                found = true;
            }
        });
        return found;
    }

    ACE_WString text(int number, const ACE_WString& defaultText) { return m_text->getText(number, defaultText); }

private:
    SmartProxy<PBText> m_text;
    SmartProxy<PDataManager> m_dataManager;
    bool m_available;
};
}

WorkshopInfoUpdater::WorkshopInfoUpdater(const ACE_WString& path) : m_path(path), m_content(10), m_loaded(false)
{
    TesselLog_Static::logTrace_static(
        kComponent, kFile, kClass,
        L"[WorkshopInfoUpdater::WorkshopInfoUpdater(const ACE_WString&)]: Constructor started.");
}

WorkshopInfoUpdater::WorkshopInfoUpdater(const WorkshopInfoUpdater& other) = default;

WorkshopInfoUpdater& WorkshopInfoUpdater::operator=(const WorkshopInfoUpdater& other) = default;

WorkshopInfoUpdater::~WorkshopInfoUpdater()
{
    TesselLog_Static::logTrace_static(kComponent, kFile, kClass,
                                      L"[WorkshopInfoUpdater::~WorkshopInfoUpdater()]: Destructor started.");
}

void WorkshopInfoUpdater::logNotLoaded(const wchar_t* operation) const
{
    TesselLog_Static::logError_static(kComponent, kFile, kClass, -1, L"WorkshopInfoUpdater::%s: not loaded", operation);
}

bool WorkshopInfoUpdater::isLoaded()
{
    return m_loaded;
}

bool WorkshopInfoUpdater::load()
{
    if (m_loaded)
    {
        warn(L"WorkshopInfoUpdater::load: file already loaded");
        return true;
    }
    const DWORD attributes = GetFileAttributesW(m_path.c_str());
    if (attributes != INVALID_FILE_ATTRIBUTES && (attributes & FILE_ATTRIBUTE_DIRECTORY) == 0)
    {
        // A file that does not parse leaves the store not loaded, so it is never overwritten.
        BSet fromFile(10);
        m_loaded = fromFile.load(m_path);
        if (m_loaded)
            m_content = std::move(fromFile);
        return m_loaded;
    }
    warn(StringUtilities::wideSprintf(
        L"WorkshopInfoUpdater::load: file '%s' does not exist, setting state to empty BSet", m_path.c_str()));
    m_content = BSet(10);
    m_loaded = true;
    return false;
}

bool WorkshopInfoUpdater::save()
{
    std::string written;
    return save(written);
}

bool WorkshopInfoUpdater::save(std::string& written)
{
    written.clear();
    if (!m_loaded)
    {
        logNotLoaded(L"save");
        return false;
    }
    if (!CWin32FileUtilities::createParentFolder(m_path.c_str()))
    {
        warn(StringUtilities::wideSprintf(L"WorkshopInfoUpdater::save: could not create parent folder for file '%s'",
                                          m_path.c_str()));
        return false;
    }
    return m_content.save(m_path, false, written);
}

const ACE_WString WorkshopInfoUpdater::readText(const wchar_t* key, const wchar_t* operation)
{
    ACE_WString value;
    if (!m_loaded)
    {
        logNotLoaded(operation);
        return value;
    }
    m_content.getString(key, value);
    return value;
}

bool WorkshopInfoUpdater::writeText(const wchar_t* key, const ACE_WString& value, const wchar_t* operation)
{
    if (!m_loaded)
    {
        logNotLoaded(operation);
        return false;
    }
    m_content.setString(key, value);
    return true;
}

const ACE_WString WorkshopInfoUpdater::getBusinessNumber()
{
    return readText(kBusinessNumber, L"getBusinessNumber");
}

bool WorkshopInfoUpdater::setBusinessNumber(const ACE_WString& value)
{
    return writeText(kBusinessNumber, value, L"setBusinessNumber");
}

const ACE_WString WorkshopInfoUpdater::getCorporateName()
{
    return readText(kCorporateName, L"getCorporateName");
}

bool WorkshopInfoUpdater::setCorporateName(const ACE_WString& value)
{
    return writeText(kCorporateName, value, L"setCorporateName");
}

const ACE_WString WorkshopInfoUpdater::getName()
{
    return readText(kName, L"getName");
}

bool WorkshopInfoUpdater::setName(const ACE_WString& value)
{
    return writeText(kName, value, L"setName");
}

const ACE_WString WorkshopInfoUpdater::getRoad()
{
    return readText(kRoad, L"getRoad");
}

bool WorkshopInfoUpdater::setRoad(const ACE_WString& value)
{
    return writeText(kRoad, value, L"setRoad");
}

const ACE_WString WorkshopInfoUpdater::getTown()
{
    return readText(kTown, L"getTown");
}

bool WorkshopInfoUpdater::setTown(const ACE_WString& value)
{
    return writeText(kTown, value, L"setTown");
}

const ACE_WString WorkshopInfoUpdater::getPostalCode()
{
    return readText(kPostalCode, L"getPostalCode");
}

bool WorkshopInfoUpdater::setPostalCode(const ACE_WString& value)
{
    return writeText(kPostalCode, value, L"setPostalCode");
}

const ACE_WString WorkshopInfoUpdater::getTelephone()
{
    return readText(kTelephone, L"getTelephone");
}

bool WorkshopInfoUpdater::setTelephone(const ACE_WString& value)
{
    return writeText(kTelephone, value, L"setTelephone");
}

const ACE_WString WorkshopInfoUpdater::getFax()
{
    return readText(kFax, L"getFax");
}

bool WorkshopInfoUpdater::setFax(const ACE_WString& value)
{
    return writeText(kFax, value, L"setFax");
}

bool WorkshopInfoUpdater::getNewDocuviaMode()
{
    if (!m_loaded)
    {
        logNotLoaded(L"getNewDocuviaMode");
        return false;
    }
    bool value = false;
    m_content.getBool(kNewDocuviaMode, value);
    return value;
}

bool WorkshopInfoUpdater::setNewDocuviaMode(bool value)
{
    if (!m_loaded)
    {
        logNotLoaded(L"setNewDocuviaMode");
        return false;
    }
    m_content.setBool(kNewDocuviaMode, value);
    return true;
}

bool WorkshopInfoUpdater::getMarvaneIDPInfos(BSet& infos) const
{
    if (!m_loaded)
    {
        logNotLoaded(L"getMarvaneIDPInfos");
        return false;
    }
    const int error = m_content.getSet(kIDPInfos, infos);
    if (error == 0)
        return true;
    TesselLog_Static::logError_static(
        kComponent, kFile, kClass, -1,
        L"WorkshopInfoUpdater::getMarvaneIDPInfosm_BSet.get('%s') failed with error '%i')", kIDPInfos, error);
    return false;
}

bool WorkshopInfoUpdater::setMarvaneIDPInfos(const BSet& infos)
{
    if (!m_loaded)
    {
        logNotLoaded(L"setMarvaneIDPInfos");
        return false;
    }
    m_content.setSet(kIDPInfos, infos);
    return true;
}

const ACE_WString WorkshopInfoUpdater::getDefaultBrand()
{
    if (!m_loaded)
    {
        logNotLoaded(L"getDefaultBrand");
        return ACE_WString();
    }
    BrandLookup lookup;
    if (!lookup.isAvailable())
        return ACE_WString();
    ACE_WString stored;
    m_content.getString(kDefaultBrand, stored);
    if (stored.length() == 0 || !lookup.contains(stored))
        return ACE_WString();
    const int number = StringUtilities::toInt(stored.c_str());
    if (number == 0)
        return ACE_WString();
    return lookup.text(number, ACE_WString());
}

const ACE_WString WorkshopInfoUpdater::getDefaultBrandKey()
{
    if (!m_loaded)
    {
        logNotLoaded(L"getDefaultBrand");
        return ACE_WString();
    }
    ACE_WString stored;
    m_content.getString(kDefaultBrand, stored);
    return stored;
}

void WorkshopInfoUpdater::setDefaultBrandKey(const ACE_WString& key)
{
    if (!m_loaded)
    {
        logNotLoaded(L"setDefaultBrand");
        return;
    }
    m_content.setString(kDefaultBrand, key);
}

bool WorkshopInfoUpdater::setDefaultBrand(const ACE_WString& brandName)
{
    if (!m_loaded)
    {
        logNotLoaded(L"setDefaultBrand");
        return false;
    }
    BrandLookup lookup;
    if (!lookup.isAvailable())
        return false;
    ACE_WString key;
    const bool found = lookup.keyOf(brandName, key);
    m_content.setString(kDefaultBrand, key);
    return found;
}
