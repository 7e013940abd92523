// Load plus save of each settings store beside raw pugixml parsing and writing the same bytes.
//
// The raw figure reads the file, parses it, writes it to a temporary file beside the target,
// syncs it, renames it over the target and syncs the folder: the same durable write as the
// stores' save. A second raw figure leaves out both syncs to show what durability costs.

#include "BSet.h"
#include "UpdateUpdater.h"
#include "UsersUpdater.h"
#include "WideString.h"
#include "WorkshopInfoUpdater.h"

#include <benchmark/benchmark.h>
#include <pugixml.hpp>

#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <string>

#include <fcntl.h>
#include <unistd.h>

namespace
{
ACE_WString w(const std::string& text)
{
    return WideString::fromUtf8(text);
}

// The benchmark's files, written once into a fresh temporary folder.
class Files
{
public:
    Files()
    {
        std::string pattern = (std::filesystem::temp_directory_path() / "ptc-bench-XXXXXX").string();
        m_dir = mkdtemp(pattern.data());
        writeSettings();
        writeUsers();
        writeWorkshop();
    }
    ~Files()
    {
        std::error_code ignored;
        std::filesystem::remove_all(m_dir, ignored);
    }

    std::string path(const std::string& name) const { return (m_dir / name).string(); }

private:
    void writeSettings()
    {
        BSet settings(10);
        settings.setBool(w("OnlineUpdateActivated"), true);
        settings.setString(w("DeploymentMode"), w("A2A"));
        settings.setString(w("DistributionFolderPath"), w("\\\\serveur-atelier\\distribution\\paquets"));
        settings.setString(w("LocalDistributionFolderPath"), w("c:\\TLD_REPOSITORY"));
        settings.setString(w("FeedbackFolderPath"), w("c:\\TLD_REPOSITORY\\Feedback"));
        settings.setString(w("UpdateRetrievalTime"), w("11:00:00"));
        settings.setInt(w("ErrorCounter"), 2);
        settings.setInt(w("MaxLogsNumber"), 10);
        settings.setBool(w("LogDebug"), false);
        settings.save(w(path("Preparateur.xml")), false);
    }

    void writeUsers()
    {
        BSet content(10);
        content.setString(w("activation"), w("1"));
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
        content.setSet(w("users"), users);
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
        content.setSet(w("App2App"), app2App);
        content.save(w(path("FicheDiagParams.xml")), false);
    }

    void writeWorkshop()
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
        workshop.setString(w("default_brand"), w("20"));
        workshop.setBool(w("new_docuvia_mode"), true);
        BSet idp(10);
        idp.setString(w("issuer"), w("https://idp.example/realms/workshops"));
        idp.setString(w("clientId"), w("workshop-diagnostic"));
        idp.setString(w("redirectUri"), w("http://localhost:8765/callback"));
        idp.setString(w("scope"), w("openid profile workshop"));
        idp.setInt(w("tokenLifetime"), 3600);
        workshop.setSet(w("IDP_Infos"), idp);
        workshop.save(w(path("InformationsGarage.xml")), false);
    }

    std::filesystem::path m_dir;
};

Files& files()
{
    static Files instance;
    return instance;
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

// Parse the file with pugixml, write it back to `target` through a temporary file.
bool rawParseAndWrite(const std::string& source, const std::string& target, bool sync)
{
    const std::string bytes = readAll(source);
    pugi::xml_document document;
    if (!document.load_buffer(bytes.data(), bytes.size()))
        return false;
    StringWriter writer;
    document.save(writer, "", pugi::format_raw, pugi::encoding_utf8);
    const std::string temporary = target + ".tmp";
    const int fd = ::open(temporary.c_str(), O_WRONLY | O_CREAT | O_TRUNC, 0644);
    if (fd < 0)
        return false;
    bool ok = ::write(fd, writer.text.data(), writer.text.size()) == static_cast<ssize_t>(writer.text.size());
    if (ok && sync)
        ok = ::fsync(fd) == 0;
    ok = ::close(fd) == 0 && ok;
    if (!ok || std::rename(temporary.c_str(), target.c_str()) != 0)
        return false;
    if (sync)
    {
        const std::string folder = std::filesystem::path(target).parent_path().string();
        const int folderFd = ::open(folder.c_str(), O_RDONLY | O_DIRECTORY);
        if (folderFd < 0)
            return false;
        ::fsync(folderFd);
        ::close(folderFd);
    }
    return true;
}

void rawCase(benchmark::State& state, const char* name, bool sync)
{
    const std::string source = files().path(name);
    const std::string target = files().path(std::string("raw-") + name);
    for (auto _ : state)
        if (!rawParseAndWrite(source, target, sync))
            state.SkipWithError("raw parse or write failed");
    state.SetBytesProcessed(static_cast<int64_t>(state.iterations()) *
                            static_cast<int64_t>(std::filesystem::file_size(source)));
}

void BM_Settings_UpdateUpdater(benchmark::State& state)
{
    const ACE_WString source = w(files().path("Preparateur.xml"));
    const ACE_WString target = w(files().path("out-Preparateur.xml"));
    for (auto _ : state)
    {
        UpdateUpdater store(source);
        if (!store.load() || !store.save(target))
            state.SkipWithError("load or save failed");
    }
}

void BM_Settings_RawPugixml(benchmark::State& state)
{
    rawCase(state, "Preparateur.xml", true);
}

void BM_Settings_RawPugixmlNoSync(benchmark::State& state)
{
    rawCase(state, "Preparateur.xml", false);
}

void BM_Users_UsersUpdater(benchmark::State& state)
{
    // The store saves to the file it loaded: work on a copy.
    const std::string copy = files().path("out-FicheDiagParams.xml");
    std::filesystem::copy_file(files().path("FicheDiagParams.xml"), copy,
                               std::filesystem::copy_options::overwrite_existing);
    for (auto _ : state)
    {
        UsersUpdater store(w(copy));
        if (!store.load() || store.getUserCount() != 20 || !store.save())
            state.SkipWithError("load or save failed");
    }
}

void BM_Users_RawPugixml(benchmark::State& state)
{
    rawCase(state, "FicheDiagParams.xml", true);
}

void BM_Users_RawPugixmlNoSync(benchmark::State& state)
{
    rawCase(state, "FicheDiagParams.xml", false);
}

void BM_Workshop_WorkshopInfoUpdater(benchmark::State& state)
{
    const std::string copy = files().path("out/InformationsGarage.xml");
    std::filesystem::create_directories(files().path("out"));
    std::filesystem::copy_file(files().path("InformationsGarage.xml"), copy,
                               std::filesystem::copy_options::overwrite_existing);
    for (auto _ : state)
    {
        WorkshopInfoUpdater store(w(copy));
        if (!store.load() || !store.save())
            state.SkipWithError("load or save failed");
    }
}

void BM_Workshop_RawPugixml(benchmark::State& state)
{
    rawCase(state, "InformationsGarage.xml", true);
}

void BM_Workshop_RawPugixmlNoSync(benchmark::State& state)
{
    rawCase(state, "InformationsGarage.xml", false);
}
}

BENCHMARK(BM_Settings_UpdateUpdater);
BENCHMARK(BM_Settings_RawPugixml);
BENCHMARK(BM_Settings_RawPugixmlNoSync);
BENCHMARK(BM_Users_UsersUpdater);
BENCHMARK(BM_Users_RawPugixml);
BENCHMARK(BM_Users_RawPugixmlNoSync);
BENCHMARK(BM_Workshop_WorkshopInfoUpdater);
BENCHMARK(BM_Workshop_RawPugixml);
BENCHMARK(BM_Workshop_RawPugixmlNoSync);

BENCHMARK_MAIN();
