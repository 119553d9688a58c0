// Opening a file to read it whole.
#include "support/read_only_file.h"

HRESULT OpenReadOnlyFile(const std::wstring& path, UniqueFileHandle& file,
                         uint64_t& size) noexcept {
    size = 0;
    file.reset(::CreateFileW(path.c_str(), GENERIC_READ, FILE_SHARE_READ, nullptr, OPEN_EXISTING,
                             FILE_ATTRIBUTE_NORMAL, nullptr));
    if (!file)
        return HRESULT_FROM_WIN32(::GetLastError());
    LARGE_INTEGER bytes{};
    if (!::GetFileSizeEx(file.get(), &bytes)) {
        const HRESULT result = HRESULT_FROM_WIN32(::GetLastError());
        file.reset();
        return result;
    }
    size = static_cast<uint64_t>(bytes.QuadPart);
    return S_OK;
}
