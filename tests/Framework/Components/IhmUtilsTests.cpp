#include "CLogsZipperGui.h"
#include "ModalDriver.h"
#include "SafeWidgetDecorator.h"
#include "TempDir.h"
#include "TesselLog_Static.h"
#include "TestText.h"

#include <QDir>
#include <QFileDialog>
#include <QLineEdit>
#include <QPushButton>

#include <gtest/gtest.h>

#include <zip.h>

#include <filesystem>
#include <map>
#include <thread>
#include <tuple>

namespace
{
using Entries = std::map<std::string, std::string>;

// Every entry of the archive with its content, read back with libzip.
Entries readArchive(const std::string& path)
{
    Entries entries;
    zip_t* archive = zip_open(path.c_str(), ZIP_RDONLY, nullptr);
    for (zip_int64_t i = 0; archive != nullptr && i < zip_get_num_entries(archive, 0); ++i)
    {
        zip_stat_t stat;
        zip_file_t* file = zip_stat_index(archive, i, 0, &stat) == 0 ? zip_fopen_index(archive, i, 0) : nullptr;
        std::string text(file != nullptr ? stat.size : 0, '\0');
        if (file != nullptr && zip_fread(file, text.data(), stat.size) == zip_int64_t(stat.size) && !zip_fclose(file))
            entries[stat.name] = text;
    }
    if (archive != nullptr)
        zip_discard(archive);
    return entries;
}

class LogsZipperTest : public ::testing::Test
{
protected:
    void SetUp() override
    {
        for (const auto& [name, content] : m_logFiles)
            TempDir::write(m_logs + "/" + name, content);
        std::filesystem::create_directories(m_dir.file("out"));
    }
    void TearDown() override { CLogsZipperGui::setLogFolder(QString()); }
    bool zip(const std::string& folder, const std::string& archive)
    {
        return CLogsZipperGui::zipFolder(qs(folder), qs(archive));
    }

    TempDir m_dir;
    const std::string m_logs = m_dir.file("Logs");
    const Entries m_logFiles = {{"Tessel.log", "first line\n"},
                                {"old/deeper/trace.txt", std::string("bin\0data", 8)},
                                {"Łódź.log", "unicode\n"}};
};

// The archive lies in the folder it archives: the earlier archive is not taken in, and no
// temporary file is left. Nothing to archive leaves the old archive.
TEST_F(LogsZipperTest, ArchivesEveryFileUnderItsRelativeNameAndReplacesTheOldArchive)
{
    TempDir::write(m_dir.file("other/only.log"), "x");
    std::filesystem::create_directories(m_dir.file("empty"));
    const std::string archive = m_logs + "/logs.zip";
    ASSERT_TRUE(zip(m_dir.file("other"), archive));
    ASSERT_TRUE(zip(m_logs, archive));
    EXPECT_EQ(readArchive(archive), m_logFiles);
    EXPECT_EQ(std::distance(std::filesystem::directory_iterator(m_logs), {}), 4); // 2 files, "old", the archive
    EXPECT_FALSE(zip(m_dir.file("empty"), archive));
    EXPECT_FALSE(zip(m_dir.file("absent"), archive));
    EXPECT_EQ(readArchive(archive), m_logFiles);
    EXPECT_FALSE(zip(m_logs, m_dir.file("nowhere/logs.zip")));
}

// The log folder is the chosen one, else the log file's, else Logs here.
TEST_F(LogsZipperTest, DialogZipsTheLogFolderToTheChosenTargetWithTheSuffix)
{
    const ACE_WString previous = TesselLog_Static::getLogFile();
    ASSERT_TRUE(TesselLog_Static::setLogFile(ACE_WString()));
    EXPECT_EQ(CLogsZipperGui::logFolder(), QDir::current().absoluteFilePath(QStringLiteral("Logs")));
    std::filesystem::create_directories(m_dir.file("other"));
    ASSERT_TRUE(TesselLog_Static::setLogFile(wide(m_dir.file("other/Tessel.log"))));
    EXPECT_EQ(CLogsZipperGui::logFolder(), qs(m_dir.file("other")));
    TesselLog_Static::setLogFile(previous);
    CLogsZipperGui::setLogFolder(qs(m_logs));
    ModalDriver::whenShown([this](QWidget& modal) {
        auto& dialog = static_cast<QFileDialog&>(modal);
        // Typed, not selected: a selection does not reach the name field while it has the focus.
        dialog.setDirectory(qs(m_dir.file("out")));
        dialog.findChild<QLineEdit*>(QStringLiteral("fileNameEdit"))->setText(QStringLiteral("saved"));
        static_cast<QDialog&>(dialog).accept();
    });
    ASSERT_TRUE(CLogsZipperGui::zipLogsWithGui());
    EXPECT_EQ(readArchive(m_dir.file("out/saved.zip")), m_logFiles);
    ModalDriver::whenShown([](QWidget& modal) { static_cast<QDialog&>(modal).reject(); });
    EXPECT_FALSE(CLogsZipperGui::zipLogsWithGui());
    EXPECT_EQ(std::distance(std::filesystem::directory_iterator(m_dir.file("out")), {}), 1);
}

// Styles of a style file replace or add to the built-in ones; a broken file changes nothing, no
// file brings back the built-in styles alone. Only known styles, only on the GUI thread.
TEST(WidgetDecorator, AppliesKnownStylesOfTheStyleFileOnTheGuiThread)
{
    TempDir dir;
    TempDir::write(dir.file("styles.xml"), "<styles><style name=\"Style84\">QDialog { color: red; }</style><style>"
                                           "QLabel { }</style><style name=\"Style99\">QLabel { }</style></styles>");
    TempDir::write(dir.file("broken.xml"), "<styles><style name=");
    SafeWidgetDecorator* decorator = SafeWidgetDecorator::getInstance();
    ASSERT_TRUE(decorator->setStyleSheetFile(QString()));
    ASSERT_TRUE(decorator->setStyleSheetFile(qs(dir.file("styles.xml"))));
    EXPECT_FALSE(decorator->setStyleSheetFile(qs(dir.file("broken.xml"))));
    EXPECT_EQ(decorator->styleSheet(QStringLiteral("Style84")), QStringLiteral("QDialog { color: red; }"));
    EXPECT_TRUE(decorator->styleSheet(QString()).isNull());
    // style, widget name, recursive, known, and the marks: the widget's style mark, its child's, and
    // its name (a widget without one takes the style's)
    const std::tuple<const char*, const char*, bool, bool, const char*> cases[] = {
        {"Style99", "", true, true, "Style99|Style99|Style99"},
        {"Style85", "kept", false, true, "Style85||kept"},
        {"Style999", "", true, false, "||"}};
    for (const auto& [style, name, recursive, known, marks] : cases)
    {
        QWidget widget;
        auto* child = new QPushButton(&widget);
        widget.setObjectName(qs(name));
        EXPECT_EQ(decorator->decorate(qs(style), widget, recursive), known) << style;
        EXPECT_EQ(widget.styleSheet(), decorator->styleSheet(qs(style)));
        EXPECT_EQ(widget.property("decoratorStyle").toString() + "|" + child->property("decoratorStyle").toString() +
                      "|" + widget.objectName(),
                  qs(marks));
    }
    QWidget widget;
    bool decorated = true;
    std::thread([&]() { decorated = decorator->decorate(QStringLiteral("Style84"), widget, true); }).join();
    EXPECT_FALSE(decorated);
    ASSERT_TRUE(decorator->setStyleSheetFile(QString()));
    EXPECT_TRUE(decorator->styleSheet(QStringLiteral("Style99")).isNull());
}
}
