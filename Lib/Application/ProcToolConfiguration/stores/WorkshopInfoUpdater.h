#pragma once

#include "BSet.h"
#include "Export.h"

#include <ace/SString.h>

#include <string>

// The workshop information file: the workshop's identity, its default brand and the
// identity-provider information. A missing file gives an empty store that saving creates.
class TESSEL_EXPORT WorkshopInfoUpdater
{
public:
    explicit WorkshopInfoUpdater(const ACE_WString& path);
    WorkshopInfoUpdater(const WorkshopInfoUpdater& other);
    WorkshopInfoUpdater& operator=(const WorkshopInfoUpdater& other);
    virtual ~WorkshopInfoUpdater();

    bool isLoaded();
    bool load();
    bool save();
    // The same, handing back the bytes written (empty on failure).
    bool save(std::string& written);

    const ACE_WString getBusinessNumber();
    bool setBusinessNumber(const ACE_WString& value);
    const ACE_WString getCorporateName();
    bool setCorporateName(const ACE_WString& value);
    const ACE_WString getName();
    bool setName(const ACE_WString& value);
    const ACE_WString getRoad();
    bool setRoad(const ACE_WString& value);
    const ACE_WString getTown();
    bool setTown(const ACE_WString& value);
    const ACE_WString getPostalCode();
    bool setPostalCode(const ACE_WString& value);
    const ACE_WString getTelephone();
    bool setTelephone(const ACE_WString& value);
    const ACE_WString getFax();
    bool setFax(const ACE_WString& value);
    // Plain bool: a const-qualified scalar result means nothing and draws a warning.
    bool getNewDocuviaMode();
    bool setNewDocuviaMode(bool value);
    bool getMarvaneIDPInfos(BSet& infos) const;
    bool setMarvaneIDPInfos(const BSet& infos);

    // The displayed name of the default brand; empty when unknown.
    const ACE_WString getDefaultBrand();
    // Stores the brand table's key whose displayed name is `brandName`; false when none matches.
    bool setDefaultBrand(const ACE_WString& brandName);
    // The same without the brand table, for a caller that reads it itself: the stored key as it
    // is, and storing a key already matched.
    const ACE_WString getDefaultBrandKey();
    void setDefaultBrandKey(const ACE_WString& key);

private:
    const ACE_WString readText(const wchar_t* key, const wchar_t* operation);
    bool writeText(const wchar_t* key, const ACE_WString& value, const wchar_t* operation);
    void logNotLoaded(const wchar_t* operation) const;

    ACE_WString m_path;
    BSet m_content;
    bool m_loaded;
};
