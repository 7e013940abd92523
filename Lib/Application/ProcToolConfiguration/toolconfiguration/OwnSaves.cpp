#include "OwnSaves.h"

#include <fstream>
#include <functional>
#include <iterator>

void OwnSaves::remember(const std::string& path)
{
    m_saved[path] = fingerprintOf(path);
}

void OwnSaves::remember(const std::string& path, const std::string& written)
{
    m_saved[path] = fingerprintOfBytes(written);
}

bool OwnSaves::isOwnSave(const std::string& path)
{
    const auto it = m_saved.find(path);
    if (it == m_saved.end())
        return false;
    if (it->second == fingerprintOf(path))
        return true;
    m_saved.erase(it);
    return false;
}

OwnSaves::Fingerprint OwnSaves::fingerprintOf(const std::string& path)
{
    Fingerprint fingerprint;
    std::ifstream in(path, std::ios::binary);
    if (!in)
        return fingerprint;
    const std::string content((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
    fingerprint = fingerprintOfBytes(content);
    fingerprint.exists = !in.bad();
    return fingerprint;
}

OwnSaves::Fingerprint OwnSaves::fingerprintOfBytes(const std::string& content)
{
    Fingerprint fingerprint;
    fingerprint.exists = true;
    fingerprint.size = content.size();
    fingerprint.hash = std::hash<std::string>()(content);
    return fingerprint;
}
