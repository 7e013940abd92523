#include "UpdateUpdater.h"

#include "StoreTestSupport.h"

#include <gtest/gtest.h>

#include <filesystem>
#include <functional>
#include <string>

using namespace StoreTest;

namespace
{
const int kTrace = TesselLog_Static::eTRACE;
const int kWarning = TesselLog_Static::eWARNING;

class UpdateUpdaterTest : public ::testing::Test
{
protected:
    std::string settingsPath() const { return m_dir.file("OnLineUpdate/Preparateur.xml"); }
    void writeSettings(const std::string& children) { TempDir::write(settingsPath(), document(children)); }

    TempDir m_dir;
    LogCapture m_log;
};

// ---- not loaded ----

struct NotLoadedCase
{
    const char* name;
    std::function<std::string(UpdateUpdater&)> call;
    std::string result;
    std::string tracePrefix;
    std::string warningPrefix;
};

void PrintTo(const NotLoadedCase& c, std::ostream* os)
{
    *os << c.name;
}

class UpdateUpdaterNotLoaded : public UpdateUpdaterTest, public ::testing::WithParamInterface<NotLoadedCase>
{
};

TEST_P(UpdateUpdaterNotLoaded, RefusesWithItsResultAndWarning)
{
    UpdateUpdater store(w(settingsPath()));
    ASSERT_FALSE(store.load());
    m_log.clear();

    const NotLoadedCase& c = GetParam();
    EXPECT_EQ(c.call(store), c.result);
    EXPECT_TRUE(m_log.contains(c.tracePrefix + ": Method started.", kTrace)) << c.name;
    EXPECT_TRUE(m_log.contains(c.warningPrefix + ": File not loaded", kWarning)) << c.name;
}

std::string flag(bool value)
{
    return value ? "true" : "false";
}

const NotLoadedCase kNotLoadedCases[] = {
    {"getCheckInternet", [](UpdateUpdater& s) { return flag(s.getCheckInternet()); }, "true",
     "[const ACE_WString UpdateUpdater::getCheckInternet()]", "[const ACE_WString UpdateUpdater::getCheckInternet()]"},
    {"setCheckInternet", [](UpdateUpdater& s) { return flag(s.setCheckInternet(true)); }, "false",
     "[bool UpdateUpdater::setCheckInternet(bool)]", "[bool UpdateUpdater::setCheckInternet(bool)]"},
    {"getDeploymentMode", [](UpdateUpdater& s) { return u(s.getDeploymentMode()); }, "",
     "[const ACE_WString UpdateUpdater::getDeploymentMode()]", "[const ACE_WString UpdateUpdater::getDeploymentMode()]"},
    {"setDeploymentMode", [](UpdateUpdater& s) { return flag(s.setDeploymentMode(w("A2A"))); }, "false",
     "[bool UpdateUpdater::setDeploymentMode(const ACE_WString&)]",
     "[bool UpdateUpdater::setDeploymentMode(const ACE_WString&)]"},
    {"getDistributionFolderPath", [](UpdateUpdater& s) { return u(s.getDistributionFolderPath()); }, "",
     "[const ACE_WString UpdateUpdater::getDistributionFolderPath()]",
     "[const ACE_WString UpdateUpdater::getDistributionFolderPath()]"},
    {"setDistributionFolderPath", [](UpdateUpdater& s) { return flag(s.setDistributionFolderPath(w("x"))); }, "false",
     "[bool UpdateUpdater::setDistributionFolderPath(const ACE_WString&)]",
     "[bool UpdateUpdater::setDistributionFolderPath(const ACE_WString&)]"},
    {"getLocalDistributionFolderPath", [](UpdateUpdater& s) { return u(s.getLocalDistributionFolderPath()); }, "",
     "[const ACE_WString UpdateUpdater::getLocalDistributionFolderPath()]",
     "[const ACE_WString UpdateUpdater::getLocalDistributionFolderPath()]"},
    {"setLocalDistributionFolderPath", [](UpdateUpdater& s) { return flag(s.setLocalDistributionFolderPath(w("x"))); },
     "false", "[bool UpdateUpdater::setLocalDistributionFolderPath(const ACE_WString&)]",
     "[bool UpdateUpdater::setLocalDistributionFolderPath(const ACE_WString&)]"},
    {"getTaskTime", [](UpdateUpdater& s) { return u(s.getTaskTime()); }, "",
     "[const ACE_WString UpdateUpdater::getTaskTime()]", "[const ACE_WString UpdateUpdater::getTaskTime()]"},
    {"setTaskTime", [](UpdateUpdater& s) { return flag(s.setTaskTime(w("07:30:00"))); }, "false",
     "[bool UpdateUpdater::setTaskTime(const ACE_WString&)]", "[bool UpdateUpdater::setTaskTime(const ACE_WString&)]"},
    {"getUpdateRetrievalTime", [](UpdateUpdater& s) { return u(s.getUpdateRetrievalTime()); }, "",
     "[const ACE_WString UpdateUpdater::getUpdateRetrievalTime()]",
     "[const ACE_WString UpdateUpdater::getUpdateRetrievalTime()]"},
    {"getFeedbackFolderPath", [](UpdateUpdater& s) { return u(s.getFeedbackFolderPath()); }, "",
     "[const ACE_WString UpdateUpdater::getFeedbackFolderPat()]",
     "[const ACE_WString UpdateUpdater::getFeedbackFolderPat()]"},
    {"getErrorCounter", [](UpdateUpdater& s) { return std::to_string(s.getErrorCounter()); }, "0",
     "[const ACE_WString UpdateUpdater::getErrorCounter()]", "[bool UpdateUpdater::getErrorCounter()]"},
    {"getMaxLogsNumber", [](UpdateUpdater& s) { return std::to_string(s.getMaxLogsNumber()); }, "0",
     "[const ACE_WString UpdateUpdater::MaxLogsNumber()]", "[bool UpdateUpdater::getMaxLogsNumber()]"},
    {"getLogDebug", [](UpdateUpdater& s) { return flag(s.getLogDebug()); }, "false",
     "[const ACE_WString UpdateUpdater::getLogDebug()]", "[const ACE_WString UpdateUpdater::getLogDebug()]"},
    {"save", [](UpdateUpdater& s) { return flag(s.save(w("never-written.xml"))); }, "false",
     "[bool UpdateUpdater::save()]", "[bool UpdateUpdater::save()]"},
};

INSTANTIATE_TEST_SUITE_P(Operations, UpdateUpdaterNotLoaded, ::testing::ValuesIn(kNotLoadedCases),
                         [](const auto& info) { return std::string(info.param.name); });

TEST_F(UpdateUpdaterTest, AbsentFileLeavesStoreNotLoadedAndWritesNothing)
{
    UpdateUpdater store(w(settingsPath()));
    EXPECT_TRUE(m_log.contains("[UpdateUpdater::UpdateUpdater(const ACE_WString&)]: Constructor started.", kTrace));
    EXPECT_FALSE(store.isLoaded());
    EXPECT_FALSE(store.load());
    EXPECT_FALSE(store.isLoaded());
    EXPECT_FALSE(store.save(w(m_dir.file("copy.xml"))));
    EXPECT_FALSE(std::filesystem::exists(m_dir.file("copy.xml")));
    // The defaults went into memory even so: they show once the file can be read.
    writeSettings(str("DeploymentMode", "OTHER"));
    EXPECT_TRUE(store.load());
    EXPECT_EQ(u(store.getDeploymentMode()), "OTHER");
    EXPECT_EQ(u(store.getTaskTime()), "11:00:00");
}

TEST_F(UpdateUpdaterTest, MalformedFileIsNotLoaded)
{
    TempDir::write(settingsPath(), "<BSet><String key=\"DeploymentMode\">A2A</BSet>");
    UpdateUpdater store(w(settingsPath()));
    EXPECT_FALSE(store.load());
    EXPECT_FALSE(store.isLoaded());
    EXPECT_EQ(u(store.getDeploymentMode()), "");
}

// ---- defaults put in by load ----

struct DefaultCase
{
    const char* key;
    const char* fileValue; // null: the key is missing
    const char* expected;
};

void PrintTo(const DefaultCase& c, std::ostream* os)
{
    *os << c.key << "=" << (c.fileValue != nullptr ? "\"" + std::string(c.fileValue) + "\"" : "(missing)");
}

class UpdateUpdaterDefaults : public UpdateUpdaterTest, public ::testing::WithParamInterface<DefaultCase>
{
};

TEST_P(UpdateUpdaterDefaults, FillsOnlyMissingOrEmptyValues)
{
    const DefaultCase& c = GetParam();
    writeSettings(str("Unrelated", "kept") + (c.fileValue != nullptr ? str(c.key, c.fileValue) : std::string()));
    UpdateUpdater store(w(settingsPath()));
    ASSERT_TRUE(store.load());
    EXPECT_TRUE(m_log.contains("[bool UpdateUpdater::setOtherInitialValues()]: Method started.", kTrace));

    ASSERT_TRUE(store.save(w(m_dir.file("saved.xml"))));
    const BSet saved = readBack(m_dir.file("saved.xml"));
    ASSERT_TRUE(saved.contains(w(c.key)));
    EXPECT_EQ(stringAt(saved, c.key), c.expected);
    EXPECT_EQ(stringAt(saved, "Unrelated"), "kept");
}

INSTANTIATE_TEST_SUITE_P(
    Keys, UpdateUpdaterDefaults,
    ::testing::Values(DefaultCase{"DeploymentMode", nullptr, "LOCAL"}, DefaultCase{"DeploymentMode", "", "LOCAL"},
                      DefaultCase{"DeploymentMode", "A2A", "A2A"},
                      DefaultCase{"DistributionFolderPath", nullptr, ""},
                      DefaultCase{"DistributionFolderPath", "\\\\srv\\dist", "\\\\srv\\dist"},
                      DefaultCase{"LocalDistributionFolderPath", nullptr, "c:\\TLD_REPOSITORY"},
                      DefaultCase{"LocalDistributionFolderPath", "", "c:\\TLD_REPOSITORY"},
                      DefaultCase{"LocalDistributionFolderPath", "d:\\repo", "d:\\repo"},
                      DefaultCase{"FeedbackFolderPath", nullptr, ""},
                      DefaultCase{"UpdateRetrievalTime", nullptr, "11:00:00"},
                      DefaultCase{"UpdateRetrievalTime", "", "11:00:00"},
                      DefaultCase{"UpdateRetrievalTime", "23:15:00", "23:15:00"}));

TEST_F(UpdateUpdaterTest, LocalRepositoryDefaultIsSeventeenCharactersWithOneBackslash)
{
    writeSettings("");
    UpdateUpdater store(w(settingsPath()));
    ASSERT_TRUE(store.load());
    EXPECT_EQ(store.getLocalDistributionFolderPath(), ACE_WString(L"c:\\TLD_REPOSITORY"));
    EXPECT_EQ(store.getLocalDistributionFolderPath().length(), 17u);
}

// ---- loaded ----

TEST_F(UpdateUpdaterTest, TypedValuesReadFromFile)
{
    writeSettings(typed("Bool", "OnlineUpdateActivated", "false") + typed("Int", "ErrorCounter", "4") +
                  typed("Int", "MaxLogsNumber", "12") + typed("Bool", "LogDebug", "true") +
                  str("FeedbackFolderPath", "C:\\fb"));
    UpdateUpdater store(w(settingsPath()));
    ASSERT_TRUE(store.load());
    EXPECT_FALSE(store.getCheckInternet());
    EXPECT_EQ(store.getErrorCounter(), 4);
    EXPECT_EQ(store.getMaxLogsNumber(), 12);
    EXPECT_TRUE(store.getLogDebug());
    EXPECT_EQ(u(store.getFeedbackFolderPath()), "C:\\fb");
}

TEST_F(UpdateUpdaterTest, SettersRoundTripThroughSave)
{
    writeSettings(typed("Int", "ErrorCounter", "2"));
    UpdateUpdater store(w(settingsPath()));
    ASSERT_TRUE(store.load());
    EXPECT_TRUE(store.setCheckInternet(true));
    EXPECT_TRUE(store.setDeploymentMode(w("A2A")));
    EXPECT_TRUE(store.setDistributionFolderPath(w("\\\\serveur\\données")));
    EXPECT_TRUE(store.setLocalDistributionFolderPath(w("e:\\repo")));
    EXPECT_TRUE(store.setTaskTime(w("07:30:00")));
    EXPECT_EQ(u(store.getUpdateRetrievalTime()), "07:30:00");
    EXPECT_TRUE(store.getCheckInternet());

    ASSERT_TRUE(store.save(w(settingsPath())));
    UpdateUpdater reread(w(settingsPath()));
    ASSERT_TRUE(reread.load());
    EXPECT_TRUE(reread.getCheckInternet());
    EXPECT_EQ(u(reread.getDeploymentMode()), "A2A");
    EXPECT_EQ(u(reread.getDistributionFolderPath()), "\\\\serveur\\données");
    EXPECT_EQ(u(reread.getLocalDistributionFolderPath()), "e:\\repo");
    EXPECT_EQ(u(reread.getTaskTime()), "07:30:00");
    EXPECT_EQ(reread.getErrorCounter(), 2);
}

TEST_F(UpdateUpdaterTest, SecondLoadKeepsEditsAndWarns)
{
    writeSettings(str("DeploymentMode", "LOCAL"));
    UpdateUpdater store(w(settingsPath()));
    ASSERT_TRUE(store.load());
    store.setDeploymentMode(w("OTHER"));
    writeSettings(str("DeploymentMode", "A2A"));
    EXPECT_TRUE(store.load());
    EXPECT_TRUE(m_log.contains("[bool UpdateUpdater::load()]: Already loaded", kWarning));
    EXPECT_EQ(u(store.getDeploymentMode()), "OTHER");
}

TEST_F(UpdateUpdaterTest, SaveToAnotherPathLeavesConstructionPathUntouched)
{
    writeSettings(str("DeploymentMode", "A2A") + typed("Double", "Custom", "0.5"));
    const std::string before = TempDir::read(settingsPath());
    UpdateUpdater store(w(settingsPath()));
    ASSERT_TRUE(store.load());
    store.setTaskTime(w("06:00:00"));
    const std::string copy = m_dir.file("OnLineUpdate/PreparateurTmp.xml");
    ASSERT_TRUE(store.save(w(copy)));
    EXPECT_EQ(TempDir::read(settingsPath()), before);
    const BSet saved = readBack(copy);
    EXPECT_EQ(stringAt(saved, "UpdateRetrievalTime"), "06:00:00");
    double custom = 0;
    EXPECT_EQ(saved.getDouble(w("Custom"), custom), 0);
    EXPECT_EQ(custom, 0.5);
}

TEST_F(UpdateUpdaterTest, FailedSaveKeepsStoreLoadedForARetry)
{
    writeSettings("");
    UpdateUpdater store(w(settingsPath()));
    ASSERT_TRUE(store.load());
    const std::string blocked = m_dir.file("blocker/file.xml");
    TempDir::write(m_dir.file("blocker"), "a file where a folder should be");
    EXPECT_FALSE(store.save(w(blocked)));
    EXPECT_TRUE(store.isLoaded());
    EXPECT_TRUE(store.save(w(m_dir.file("retry.xml"))));
}

// ---- copies ----

TEST_F(UpdateUpdaterTest, CopiesAreIndependentAndKeepTheState)
{
    writeSettings(str("DeploymentMode", "A2A"));
    UpdateUpdater original(w(settingsPath()));
    UpdateUpdater notLoadedCopy(original);
    ASSERT_TRUE(original.load());
    EXPECT_FALSE(notLoadedCopy.isLoaded());

    UpdateUpdater copy(original);
    EXPECT_TRUE(copy.isLoaded());
    copy.setDeploymentMode(w("OTHER"));
    EXPECT_EQ(u(original.getDeploymentMode()), "A2A");

    notLoadedCopy = copy;
    EXPECT_TRUE(notLoadedCopy.isLoaded());
    EXPECT_EQ(u(notLoadedCopy.getDeploymentMode()), "OTHER");
}
}
