#pragma once

#include "CComponent_Thread_NoRef.h"

#include <memory>

class IComponentManager;

// The text component ("tessel:BText?BText"): a catalogue of texts by identifier, loaded from
// an XML set whose keys are the identifiers (catalogue numbers written in decimal) and whose
// values are the texts.
class TESSEL_EXPORT CBText : public CComponent_Thread_NoRef
{
public:
    static const wchar_t* const componentID;

    CBText();
    ~CBText() override;

    static CBText* registerWith(IComponentManager& manager);

    // Replaces the catalogue; false (catalogue unchanged) when the file cannot be read.
    bool loadCatalogue(const ACE_WString& path);
    void setText(const ACE_WString& textId, const ACE_WString& text);

    // The text for the identifier, or exactly `defaultText` when there is none.
    ACE_WString getText(const ACE_WString& textId, const ACE_WString& defaultText) const;
    ACE_WString getText(int textId, const ACE_WString& defaultText) const;

private:
    struct Impl;
    std::unique_ptr<Impl> m_impl;
};
