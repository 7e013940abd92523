#pragma once

#include "BSet.h"

#include <pugixml.hpp>

#include <filesystem>
#include <memory>
#include <string>
#include <utility>
#include <vector>

class CDataManager;
class CToolConfigControllersFactory;
class IComponentManager;
class WidgetCommandBase;

// The framework the dialog runs in, with realistic files in a fresh folder: a full workshop
// file, 20 users with an App2App block, full online-update settings and `brands` brands with
// their texts. Lines are logged to a file in non-recording mode, as on a workshop machine.
// Holds the operations the benchmark measures and their lower bounds.
class BenchSetup
{
public:
    enum class File
    {
        Workshop,
        Users,
        Update
    };

    explicit BenchSetup(int brands);
    ~BenchSetup();
    BenchSetup(const BenchSetup&) = delete;
    BenchSetup& operator=(const BenchSetup&) = delete;

    // The dialog's controllers from the factory, initialised (every record published), then
    // destroyed.
    void openAndClose();
    // Opens and keeps the controllers for the operations below.
    void openKept();
    void cancel();
    void ok();
    void fileChanged(File file);

    // Reads and parses the three files with pugixml and writes as many records into a map as
    // an open publishes.
    void parseAndPublishLowerBound();
    // Serialises the three documents an OK saves; with `io`, writes each durably as a save does.
    void serialiseLowerBound(bool io);

    // A typed-value file of about `kib` KiB of nested sets, strings, numbers and flags.
    void writeTypedValueFile(int kib);
    void loadTypedValueFile();
    void saveTypedValueFile();
    void parseTypedValueFileLowerBound();
    void serialiseTypedValueFileLowerBound();

private:
    void writeFiles(int brands);
    void collectPublishedRecords();
    std::string path(File file) const;

    std::filesystem::path m_dir;
    IComponentManager* m_manager = nullptr;
    CDataManager* m_dataManager = nullptr; // owned by the manager
    std::unique_ptr<CToolConfigControllersFactory> m_factory;
    std::unique_ptr<WidgetCommandBase> m_toolConfiguration;
    std::unique_ptr<WidgetCommandBase> m_users;
    // Every leaf an open publishes, as path and text.
    std::vector<std::pair<std::wstring, std::wstring>> m_published;
    pugi::xml_document m_saved[3];
    std::string m_typedPath;
    std::string m_typedCopyPath;
    BSet m_typed;
    pugi::xml_document m_typedDocument;
};
