#pragma once

#include <cstddef>
#include <map>
#include <string>

// What the dialog last saved to each of its files, so the watcher's report of that save does not
// rebuild the dialog while any other change of the file still does.
class OwnSaves
{
public:
    // Remembers what `path` holds now, right after a save.
    void remember(const std::string& path);
    // Remembers that `path` holds `written`, the bytes a save just wrote to it.
    void remember(const std::string& path, const std::string& written);
    // True when `path` still holds what was remembered for it. A file found different is
    // forgotten, so coming back to the saved content later is a change again.
    bool isOwnSave(const std::string& path);

private:
    struct Fingerprint
    {
        bool exists = false;
        std::size_t size = 0;
        std::size_t hash = 0;
        bool operator==(const Fingerprint& other) const
        {
            return exists == other.exists && size == other.size && hash == other.hash;
        }
    };
    static Fingerprint fingerprintOf(const std::string& path);
    static Fingerprint fingerprintOfBytes(const std::string& content);

    std::map<std::string, Fingerprint> m_saved;
};
