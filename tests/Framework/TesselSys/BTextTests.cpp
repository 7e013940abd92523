#include "BInt.h"
#include "BSet.h"
#include "ComponentFixture.h"
#include "LogCapture.h"
#include "PBText.h"
#include "SmartProxy.h"
#include "TempDir.h"
#include "WideString.h"

#include <gtest/gtest.h>

namespace
{
std::string text(const ACE_WString& value)
{
    return WideString::toUtf8(value);
}

class BTextTest : public ComponentFixture
{
protected:
    // Writes a catalogue file and loads it into the component.
    void loadCatalogue(const BSet& catalogue)
    {
        const std::string path = m_dir.file("texts.xml");
        ASSERT_TRUE(catalogue.save(WideString::fromUtf8(path), false));
        ASSERT_TRUE(m_text->loadCatalogue(WideString::fromUtf8(path)));
    }
    TempDir m_dir;
};

TEST_F(BTextTest, IdentifierWithoutTextGivesExactlyTheDefault)
{
    m_text->setText(ACE_WString(L"969"), ACE_WString(L"Ajouter"));
    m_text->setText(ACE_WString(L"BRAND_A"), ACE_WString(L"Marque A"));
    for (const wchar_t* fallback : {L"", L"Default text", L" padded "})
    {
        EXPECT_EQ(m_text->getText(970, ACE_WString(fallback)), ACE_WString(fallback));
        EXPECT_EQ(m_text->getText(-969, ACE_WString(fallback)), ACE_WString(fallback));
        EXPECT_EQ(m_text->getText(ACE_WString(L"BRAND_B"), ACE_WString(fallback)), ACE_WString(fallback));
        EXPECT_EQ(m_text->getText(ACE_WString(L"brand_a"), ACE_WString(fallback)), ACE_WString(fallback));
        EXPECT_EQ(m_text->getText(ACE_WString(L""), ACE_WString(fallback)), ACE_WString(fallback));
    }
    EXPECT_EQ(text(m_text->getText(969, ACE_WString(L""))), "Ajouter");
    EXPECT_EQ(text(m_text->getText(ACE_WString(L"BRAND_A"), ACE_WString(L"x"))), "Marque A");
}

TEST_F(BTextTest, CatalogueFileGivesTextsByNumberAndByName)
{
    BSet catalogue;
    catalogue.setString(ACE_WString(L"969"), ACE_WString(L"Ajouter"));
    catalogue.setString(ACE_WString(L"19009"), ACE_WString(L"Utilisateurs"));
    catalogue.setString(ACE_WString(L"BRAND_A"), ACE_WString(L"Marque \u00e9"));
    catalogue.setInt(ACE_WString(L"985"), 12);
    LogCapture log;
    loadCatalogue(catalogue);

    EXPECT_EQ(text(m_text->getText(969, ACE_WString(L"d"))), "Ajouter");
    EXPECT_EQ(text(m_text->getText(ACE_WString(L"19009"), ACE_WString(L"d"))), "Utilisateurs");
    EXPECT_EQ(m_text->getText(ACE_WString(L"BRAND_A"), ACE_WString(L"d")), ACE_WString(L"Marque \u00e9"));
    EXPECT_EQ(text(m_text->getText(985, ACE_WString(L"not a text"))), "not a text");
    EXPECT_TRUE(log.containsSubstring("'985'", TesselLog_Static::eERROR));
}

TEST_F(BTextTest, UnreadableCatalogueKeepsTheTextsThere)
{
    m_text->setText(ACE_WString(L"4531"), ACE_WString(L"Nom"));
    TempDir::write(m_dir.file("broken.xml"), "<not closed");
    for (const std::string& path : {m_dir.file("missing.xml"), m_dir.file("broken.xml")})
        EXPECT_FALSE(m_text->loadCatalogue(WideString::fromUtf8(path))) << path;
    EXPECT_EQ(text(m_text->getText(4531, ACE_WString(L"d"))), "Nom");

    BSet replacement;
    replacement.setString(ACE_WString(L"4532"), ACE_WString(L"Adresse"));
    loadCatalogue(replacement);
    EXPECT_EQ(text(m_text->getText(4531, ACE_WString(L"gone"))), "gone");
    EXPECT_EQ(text(m_text->getText(4532, ACE_WString(L"d"))), "Adresse");
}

TEST_F(BTextTest, ProxyAnswersTheDefaultOnceTheComponentIsGone)
{
    m_text->setText(ACE_WString(L"986"), ACE_WString(L"Supprimer"));
    SmartProxy<PBText> texts;
    ASSERT_TRUE(texts.acquire(ID(CBText::componentID)));
    EXPECT_EQ(text(texts->getText(986, ACE_WString(L"d"))), "Supprimer");
    EXPECT_EQ(text(texts->getText(ACE_WString(L"986"), ACE_WString(L"d"))), "Supprimer");

    ASSERT_EQ(destroyText(), 0);
    EXPECT_EQ(texts->component(), nullptr);
    EXPECT_EQ(text(texts->getText(986, ACE_WString(L"Delete"))), "Delete");
    EXPECT_EQ(text(texts->getText(ACE_WString(L"986"), ACE_WString(L""))), "");
}
}
