#include "BData.h"

#include "BSet.h"
#include "SettingsFile.h"
#include "TesselLog_Static.h"
#include "WideString.h"
#include "XmlSetCodec.h"

#include <string>

namespace
{
void warn(const char* operation, const std::string& path, const std::string& reason)
{
    TesselLog_Static::log_static(TesselLog_Static::eWARNING, 0, "TesselData", "libTesselData.so", "BData",
                                 L"BData::%S: '%S': %S", operation, path.c_str(), reason.c_str());
}
}

BData::~BData() = default;

bool BData::load(const ACE_WString& path)
{
    const std::string file = SettingsFile::nativePath(WideString::toUtf8(path));
    if (type() != eSET)
    {
        warn("load", file, "only a set can be loaded");
        return false;
    }
    if (file.empty())
    {
        warn("load", file, "empty path");
        return false;
    }
    std::string bytes;
    std::string error;
    int errorNumber = 0;
    if (!SettingsFile::read(file, bytes, error, errorNumber))
    {
        warn("load", file, error);
        return false;
    }
    BSet loaded;
    if (!XmlSetCodec::parse(bytes, loaded, error))
    {
        warn("load", file, error);
        return false;
    }
    static_cast<BSet&>(*this) = std::move(loaded);
    return true;
}

bool BData::save(const ACE_WString& path, bool flag) const
{
    std::string written;
    return save(path, flag, written);
}

bool BData::save(const ACE_WString& path, bool /*flag*/, std::string& written) const
{
    written.clear();
    const std::string file = SettingsFile::nativePath(WideString::toUtf8(path));
    if (type() != eSET)
    {
        warn("save", file, "only a set can be saved");
        return false;
    }
    if (file.empty())
    {
        warn("save", file, "empty path");
        return false;
    }
    std::string bytes;
    std::string error;
    int errorNumber = 0;
    if (!XmlSetCodec::write(static_cast<const BSet&>(*this), bytes, error) ||
        !SettingsFile::writeAtomically(file, bytes, error, errorNumber))
    {
        warn("save", file, error);
        return false;
    }
    written = std::move(bytes);
    return true;
}
