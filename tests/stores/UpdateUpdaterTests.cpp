#include "UpdateUpdater.h"

#include "StoreTestSupport.h"

using namespace StoreTest;

namespace
{
using UpdateUpdaterTest = StoreFixture<UpdateUpdater>;

// Missing or empty values get their defaults, present ones and unknown keys are kept.
TEST_F(UpdateUpdaterTest, LoadFillsOnlyMissingOrEmptyValues)
{
    ASSERT_TRUE(
        loaded(str("Unrelated", "kept") + str("DeploymentMode", "") + str("LocalDistributionFolderPath", "d:\\repo"))
            .save(wide(path())));
    BSet saved = SettingsFiles::read(path());
    std::string values;
    for (const char* key : {"Unrelated", "DeploymentMode", "DistributionFolderPath", "LocalDistributionFolderPath",
                            "FeedbackFolderPath", "UpdateRetrievalTime"})
        values += SettingsFiles::stringAt(saved, key) + (saved.contains(wide(key)) ? "|" : "(missing)|");
    EXPECT_EQ(values, "kept|LOCAL||d:\\repo||11:00:00|");
}

TEST_F(UpdateUpdaterTest, ValuesRoundTripThroughSaveAndASecondLoadKeepsEdits)
{
    UpdateUpdater& store = loaded(typed("Bool", "OnlineUpdateActivated", "false") + typed("Int", "ErrorCounter", "4") +
                                  typed("Int", "MaxLogsNumber", "12") + typed("Bool", "LogDebug", "true"));
    EXPECT_FALSE(store.getCheckInternet());
    EXPECT_TRUE(store.getErrorCounter() == 4 && store.getMaxLogsNumber() == 12 && store.getLogDebug());
    EXPECT_TRUE(store.setCheckInternet(true) && store.setDeploymentMode(L"A2A"_w) && store.setTaskTime(L"07:30:00"_w));
    EXPECT_TRUE(store.setDistributionFolderPath(wide("\\\\serveur\\données")) &&
                store.setLocalDistributionFolderPath(L"e:\\repo"_w));
    EXPECT_EQ(utf8(store.getUpdateRetrievalTime()), "07:30:00");
    TempDir::write(m_dir.file("blocker"), "a file where a folder should be");
    EXPECT_FALSE(store.save(wide(m_dir.file("blocker/file.xml"))));
    ASSERT_TRUE(store.save(wide(path())));
    EXPECT_TRUE(store.setDeploymentMode(L"OTHER"_w));
    EXPECT_TRUE(store.load());
    EXPECT_TRUE(m_log.contains("[bool UpdateUpdater::load()]: Already loaded", kWarning));
    EXPECT_EQ(utf8(store.getDeploymentMode()), "OTHER");

    UpdateUpdater& saved = reread();
    EXPECT_TRUE(saved.getCheckInternet() && saved.getErrorCounter() == 4);
    EXPECT_EQ(utf8(saved.getDeploymentMode() + L"|"_w + saved.getDistributionFolderPath() + L"|"_w +
                   saved.getLocalDistributionFolderPath() + L"|"_w + saved.getTaskTime() +
                   saved.getFeedbackFolderPath()),
              "A2A|\\\\serveur\\données|e:\\repo|07:30:00");
}
}
