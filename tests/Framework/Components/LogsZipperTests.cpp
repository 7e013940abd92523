#include "CLogsZipperGui.h"
#include "ModalDriver.h"
#include "SafeWidgetDecorator.h"
#include "TempDir.h"
#include "TesselLog_Static.h"
#include "WideString.h"

#include <QFileDialog>
#include <QLabel>
#include <QPushButton>
#include <QVBoxLayout>
#include <QWidget>

#include <gtest/gtest.h>

#include <zip.h>

#include <filesystem>
#include <map>
#include <string>

namespace
{
// Every entry of the archive with its content, read back with libzip.
std::map<std::string, std::string> readArchive(const std::string& path)
{
    std::map<std::string, std::string> entries;
    int error = 0;
    zip_t* archive = zip_open(path.c_str(), ZIP_RDONLY, &error);
    if (archive == nullptr)
        return entries;
    const zip_int64_t count = zip_get_num_entries(archive, 0);
    for (zip_int64_t i = 0; i < count; ++i)
    {
        zip_stat_t stat;
        if (zip_stat_index(archive, static_cast<zip_uint64_t>(i), 0, &stat) != 0)
            continue;
        std::string content(static_cast<size_t>(stat.size), '\0');
        zip_file_t* file = zip_fopen_index(archive, static_cast<zip_uint64_t>(i), 0);
        if (file == nullptr)
            continue;
        zip_fread(file, content.data(), stat.size);
        zip_fclose(file);
        entries[stat.name] = content;
    }
    zip_close(archive);
    return entries;
}

size_t filesIn(const std::filesystem::path& folder)
{
    size_t count = 0;
    for (const auto& entry : std::filesystem::directory_iterator(folder))
        count += entry.is_regular_file() ? 1 : 0;
    return count;
}

class LogsZipperTest : public ::testing::Test
{
protected:
    void SetUp() override
    {
        m_logs = m_dir.file("Logs");
        TempDir::write(m_logs + "/Tessel.log", "first line\n");
        TempDir::write(m_logs + "/old/Tessel.1.log", "older\n");
        TempDir::write(m_logs + "/old/deeper/trace.txt", std::string("binary\0data", 11));
        TempDir::write(m_logs + "/Łódź.log", "unicode name\n");
        std::filesystem::create_directories(m_dir.file("out"));
    }
    void TearDown() override { CLogsZipperGui::setLogFolder(QString()); }

    TempDir m_dir;
    std::string m_logs;
};

TEST_F(LogsZipperTest, ArchivesEveryFileUnderItsRelativeName)
{
    const std::string zip = m_dir.file("out/logs.zip");
    ASSERT_TRUE(CLogsZipperGui::zipFolder(QString::fromStdString(m_logs), QString::fromStdString(zip)));
    const auto entries = readArchive(zip);
    const std::map<std::string, std::string> expected = {{"Tessel.log", "first line\n"},
                                                         {"old/Tessel.1.log", "older\n"},
                                                         {"old/deeper/trace.txt", std::string("binary\0data", 11)},
                                                         {"Łódź.log", "unicode name\n"}};
    EXPECT_EQ(entries, expected);
    EXPECT_EQ(filesIn(m_dir.file("out")), 1u);
}

TEST_F(LogsZipperTest, ReplacesAnOldArchiveWhole)
{
    const std::string zip = m_dir.file("out/logs.zip");
    TempDir::write(m_dir.file("other/only.log"), "x");
    ASSERT_TRUE(CLogsZipperGui::zipFolder(QString::fromStdString(m_dir.file("other")), QString::fromStdString(zip)));
    ASSERT_TRUE(CLogsZipperGui::zipFolder(QString::fromStdString(m_logs), QString::fromStdString(zip)));
    const auto entries = readArchive(zip);
    EXPECT_EQ(entries.count("only.log"), 0u);
    EXPECT_EQ(entries.size(), 4u);
    EXPECT_EQ(filesIn(m_dir.file("out")), 1u);
}

TEST_F(LogsZipperTest, ArchiveInsideTheFolderDoesNotArchiveItself)
{
    const std::string zip = m_logs + "/logs.zip";
    ASSERT_TRUE(CLogsZipperGui::zipFolder(QString::fromStdString(m_logs), QString::fromStdString(zip)));
    ASSERT_TRUE(CLogsZipperGui::zipFolder(QString::fromStdString(m_logs), QString::fromStdString(zip)));
    const auto entries = readArchive(zip);
    EXPECT_EQ(entries.count("logs.zip"), 0u);
    EXPECT_EQ(entries.size(), 4u);
}

TEST_F(LogsZipperTest, NothingToArchiveLeavesTheOldArchive)
{
    const std::string zip = m_dir.file("out/logs.zip");
    TempDir::write(zip, "previous archive");
    std::filesystem::create_directories(m_dir.file("empty"));
    EXPECT_FALSE(CLogsZipperGui::zipFolder(QString::fromStdString(m_dir.file("empty")), QString::fromStdString(zip)));
    EXPECT_FALSE(CLogsZipperGui::zipFolder(QString::fromStdString(m_dir.file("absent")), QString::fromStdString(zip)));
    EXPECT_EQ(TempDir::read(zip), "previous archive");
    // A target folder that does not exist.
    EXPECT_FALSE(CLogsZipperGui::zipFolder(QString::fromStdString(m_logs),
                                           QString::fromStdString(m_dir.file("nowhere/logs.zip"))));
}

TEST_F(LogsZipperTest, LogFolderIsTheLogFilesFolderUnlessSet)
{
    const ACE_WString previous = TesselLog_Static::getLogFile();
    ASSERT_TRUE(TesselLog_Static::setLogFile(WideString::fromUtf8(m_logs + "/Tessel.log")));
    EXPECT_EQ(CLogsZipperGui::logFolder().toStdString(), m_logs);
    CLogsZipperGui::setLogFolder(QString::fromStdString(m_dir.file("chosen")));
    EXPECT_EQ(CLogsZipperGui::logFolder().toStdString(), m_dir.file("chosen"));
    TesselLog_Static::setLogFile(previous);
}

TEST_F(LogsZipperTest, DialogChoosesTheTargetAndAddsTheSuffix)
{
    CLogsZipperGui::setLogFolder(QString::fromStdString(m_logs));
    const std::string chosen = m_dir.file("out/saved");
    ModalDriver::whenShown([chosen](QWidget& modal) {
        auto* dialog = qobject_cast<QFileDialog*>(&modal);
        ASSERT_NE(dialog, nullptr);
        dialog->selectFile(QString::fromStdString(chosen));
        static_cast<QDialog*>(dialog)->accept();
    });
    ASSERT_TRUE(CLogsZipperGui::zipLogsWithGui());
    EXPECT_EQ(readArchive(chosen + ".zip").size(), 4u);
}

TEST_F(LogsZipperTest, CancelledDialogWritesNothing)
{
    CLogsZipperGui::setLogFolder(QString::fromStdString(m_logs));
    ModalDriver::whenShown([](QWidget& modal) { static_cast<QDialog&>(modal).reject(); });
    EXPECT_FALSE(CLogsZipperGui::zipLogsWithGui());
    EXPECT_EQ(filesIn(m_dir.file("out")), 0u);
}

class WidgetDecoratorTest : public ::testing::Test
{
protected:
    void TearDown() override { SafeWidgetDecorator::getInstance()->setStyleSheetFile(QString()); }
};

TEST_F(WidgetDecoratorTest, BuiltInStylesAreApplied)
{
    for (const char* style : {"Style84", "Style85"})
    {
        QWidget widget;
        auto* layout = new QVBoxLayout(&widget);
        auto* button = new QPushButton(QStringLiteral("Cancel"));
        layout->addWidget(button);
        ASSERT_TRUE(SafeWidgetDecorator::getInstance()->decorate(QString::fromUtf8(style), widget, true));
        EXPECT_FALSE(widget.styleSheet().isEmpty());
        EXPECT_EQ(widget.styleSheet(), SafeWidgetDecorator::getInstance()->styleSheet(QString::fromUtf8(style)));
        EXPECT_EQ(widget.property("decoratorStyle").toString().toStdString(), style);
        EXPECT_EQ(button->property("decoratorStyle").toString().toStdString(), style);
    }
}

TEST_F(WidgetDecoratorTest, NotRecursiveLeavesChildrenUnmarked)
{
    QWidget widget;
    auto* label = new QLabel(&widget);
    widget.setObjectName(QStringLiteral("kept"));
    ASSERT_TRUE(SafeWidgetDecorator::getInstance()->decorate(QStringLiteral("Style85"), widget, false));
    EXPECT_FALSE(label->property("decoratorStyle").isValid());
    EXPECT_EQ(widget.objectName(), QStringLiteral("kept"));
}

TEST_F(WidgetDecoratorTest, UnknownStyleLeavesTheWidgetAlone)
{
    QWidget widget;
    EXPECT_FALSE(SafeWidgetDecorator::getInstance()->decorate(QStringLiteral("Style999"), widget, true));
    EXPECT_TRUE(widget.styleSheet().isEmpty());
    EXPECT_FALSE(widget.property("decoratorStyle").isValid());
}

TEST_F(WidgetDecoratorTest, StyleFileReplacesAndAddsStyles)
{
    TempDir dir;
    const std::string path = dir.file("styles.xml");
    TempDir::write(path, "<styles><style name=\"Style84\">QDialog { color: red; }</style>"
                         "<style name=\"Style99\">QLabel { color: blue; }</style></styles>");
    SafeWidgetDecorator* decorator = SafeWidgetDecorator::getInstance();
    const QString builtIn85 = decorator->styleSheet(QStringLiteral("Style85"));
    ASSERT_TRUE(decorator->setStyleSheetFile(QString::fromStdString(path)));
    EXPECT_EQ(decorator->styleSheet(QStringLiteral("Style84")), QStringLiteral("QDialog { color: red; }"));
    EXPECT_EQ(decorator->styleSheet(QStringLiteral("Style99")), QStringLiteral("QLabel { color: blue; }"));
    EXPECT_EQ(decorator->styleSheet(QStringLiteral("Style85")), builtIn85);

    // A broken file changes nothing.
    TempDir::write(dir.file("broken.xml"), "<styles><style name=");
    EXPECT_FALSE(decorator->setStyleSheetFile(QString::fromStdString(dir.file("broken.xml"))));
    EXPECT_EQ(decorator->styleSheet(QStringLiteral("Style99")), QStringLiteral("QLabel { color: blue; }"));
}
}
