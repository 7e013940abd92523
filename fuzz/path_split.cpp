// _wsplitpath_s on the input: byte 0 chooses null pointers (bits 0-3: drive, folder, name,
// extension; bit 4: the path), bytes 1-4 are the four buffer sizes, the rest is the path as UTF-8
// up to its first NUL. Buffers are heap blocks of exactly the given size, so AddressSanitizer
// sees any write past them. Checked: EINVAL when a pointer and its size disagree, ERANGE exactly
// when a part does not fit, every given buffer emptied on failure, the parts on success.

#include "FuzzSupport.h"
#include "WideString.h"
#include "Win32File.h"

#include <cerrno>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <string>

namespace
{
const int kParts = 4;

bool isSeparator(wchar_t c)
{
    return c == L'/' || c == L'\\';
}

// The four parts of `path`, split with buffers large enough for any of them.
void referenceParts(const std::wstring& path, std::wstring parts[kParts])
{
    const std::size_t size = path.size() + 1;
    std::unique_ptr<wchar_t[]> buffers[kParts];
    for (auto& buffer : buffers)
        buffer = std::make_unique<wchar_t[]>(size);
    const auto pathCopy = std::make_unique<wchar_t[]>(size);
    path.copy(pathCopy.get(), path.size());
    pathCopy[path.size()] = L'\0';
    FUZZ_CHECK(_wsplitpath_s(pathCopy.get(), buffers[0].get(), size, buffers[1].get(), size, buffers[2].get(), size,
                             buffers[3].get(), size) == 0);
    for (int i = 0; i < kParts; ++i)
        parts[i] = buffers[i].get();
    const std::wstring& drive = parts[0];
    const std::wstring& folder = parts[1];
    const std::wstring& name = parts[2];
    const std::wstring& extension = parts[3];
    FUZZ_CHECK(drive + folder + name + extension == path);
    FUZZ_CHECK(drive.empty() || (drive.size() == 2 && drive[1] == L':'));
    FUZZ_CHECK(folder.empty() || isSeparator(folder.back()));
    for (const wchar_t c : name + extension)
        FUZZ_CHECK(!isSeparator(c));
    FUZZ_CHECK(extension.empty() || (extension[0] == L'.' && extension.find(L'.', 1) == std::wstring::npos));
}
}

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    if (size < 1 + kParts)
        return 0;
    const unsigned flags = data[0];
    std::string text(reinterpret_cast<const char*>(data) + 1 + kParts, size - 1 - kParts);
    text = text.c_str();
    const std::wstring path = WideString::toStd(WideString::fromUtf8(text));
    const bool nullPath = (flags & 0x10) != 0;

    std::unique_ptr<wchar_t[]> owned[kParts];
    wchar_t* buffers[kParts];
    std::size_t sizes[kParts];
    bool consistent = !nullPath;
    for (int i = 0; i < kParts; ++i)
    {
        sizes[i] = data[1 + i];
        const bool null = (flags & (1u << i)) != 0;
        if (!null)
        {
            owned[i].reset(new wchar_t[sizes[i]]);
            for (std::size_t j = 0; j < sizes[i]; ++j)
                owned[i][j] = L'#';
        }
        buffers[i] = owned[i].get();
        consistent = consistent && (null == (sizes[i] == 0));
    }
    const std::unique_ptr<wchar_t[]> pathBuffer(new wchar_t[path.size() + 1]);
    path.copy(pathBuffer.get(), path.size());
    pathBuffer[path.size()] = L'\0';

    errno = 0;
    const errno_t result = _wsplitpath_s(nullPath ? nullptr : pathBuffer.get(), buffers[0], sizes[0], buffers[1],
                                         sizes[1], buffers[2], sizes[2], buffers[3], sizes[3]);
    errno_t expected = EINVAL;
    std::wstring parts[kParts];
    if (consistent)
    {
        referenceParts(path, parts);
        expected = 0;
        for (int i = 0; i < kParts; ++i)
            if (buffers[i] != nullptr && parts[i].size() >= sizes[i])
                expected = ERANGE;
    }
    FUZZ_CHECK(result == expected);
    FUZZ_CHECK(result == 0 || errno == result);
    for (int i = 0; i < kParts; ++i)
    {
        if (buffers[i] == nullptr || sizes[i] == 0)
            continue;
        if (result == 0)
            FUZZ_CHECK(parts[i] == buffers[i]);
        else
            FUZZ_CHECK(buffers[i][0] == L'\0');
    }
    return 0;
}
