// The external-library adapter: loading, object creation, points buffer, port number, texts.
#include "download/halvek_comm.h"

#include <cstring>
#include <new>

#include "res/resource.h"
#include "support/error_handling.h"
#include "support/module_instance.h"
#include "support/read_only_file.h"
#include "support/text_lookup.h"

namespace {

constexpr size_t kFilePathBytes = 260;

std::wstring ModuleDirectory() {
    const std::wstring path = ThisModulePath();
    const size_t slash = path.find_last_of(L"\\/");
    return slash == std::wstring::npos ? std::wstring() : path.substr(0, slash + 1);
}

}  // namespace

HRESULT CheckReceivedFile(const std::wstring& path) noexcept {
    try {
        // Sharing read only: a library still writing the file holds it open for writing, and the
        // open then fails with a sharing violation instead of handing on half a file.
        UniqueFileHandle file;
        uint64_t size = 0;
        const HRESULT opened = OpenReadOnlyFile(path, file, size);
        if (FAILED(opened))
            return opened;
        if (size == 0)
            return HRESULT_FROM_WIN32(ERROR_INVALID_DATA);
        // A file that ends where its drive ran out of room was most likely cut short there.
        const size_t slash = path.find_last_of(L"\\/");
        const std::wstring folder = slash == std::wstring::npos ? path : path.substr(0, slash + 1);
        ULARGE_INTEGER available{};
        if (::GetDiskFreeSpaceExW(folder.c_str(), &available, nullptr, nullptr) &&
            available.QuadPart == 0) {
            return HRESULT_FROM_WIN32(ERROR_DISK_FULL);
        }
        return S_OK;
    }
    CATCH_RETURN()
}

HRESULT CreateHalvekObject(UniqueHalvekObject& object, std::wstring& errorText) noexcept {
    try {
        return CreateHalvekObjectFrom(ModuleDirectory() + L"HalvekComm.dll", object, errorText);
    }
    CATCH_RETURN()
}

HRESULT CreateHalvekObjectFrom(const std::wstring& libraryPath, UniqueHalvekObject& object,
                               std::wstring& errorText) noexcept {
    try {
        object.reset();
        // The library's own dependencies come from its folder and the system's, never from the
        // host's current directory or PATH, where anyone may put a file of that name. (Windows 7
        // needs its update KB2533623 for these flags; without it the load fails and says so.)
        // Deliberately never freed: the library keeps threads and state of its own.
        const HMODULE library =
            ::LoadLibraryExW(libraryPath.c_str(), nullptr,
                             LOAD_LIBRARY_SEARCH_DLL_LOAD_DIR | LOAD_LIBRARY_SEARCH_DEFAULT_DIRS);
        if (!library) {
            const HRESULT result = HRESULT_FROM_WIN32(::GetLastError());
            errorText = SystemResultText(result, libraryPath);
            return result;
        }
        const auto createInstance = reinterpret_cast<HalvekCreateInstanceFunction>(
            reinterpret_cast<void*>(::GetProcAddress(library, "CreateInstance")));
        if (!createInstance) {
            const HRESULT result = HRESULT_FROM_WIN32(::GetLastError());
            errorText = SystemResultText(result);
            return result;
        }
        object.reset(createInstance());
        if (!object) {
            errorText = SystemResultText(E_OUTOFMEMORY);
            return E_OUTOFMEMORY;
        }
        (void)object->Initialize();  // its result means nothing to this system
        return S_OK;
    }
    CATCH_RETURN()
}

std::unique_ptr<uint8_t[]> MakeHalvekPointsBuffer() {
    // The rest of each record is the library's to fill: left as it comes.
    std::unique_ptr<uint8_t[]> buffer(new (std::nothrow) uint8_t[kHalvekPointsBufferSize]);
    if (!buffer)
        return buffer;
    const int32_t marker = -1;
    for (size_t half = 0; half < kHalvekPointsBufferSize / kHalvekPointHalfSize; ++half)
        std::memcpy(buffer.get() + half * kHalvekPointHalfSize + kHalvekPointMarkerOffset, &marker,
                    sizeof marker);
    return buffer;
}

int32_t HalvekPortNumber(WideStringView port) noexcept {
    size_t index = 0;
    while (index < port.size() && (port[index] < '0' || port[index] > '9'))
        ++index;
    int32_t number = 0;
    for (; index < port.size() && port[index] >= '0' && port[index] <= '9'; ++index) {
        const int32_t digit = port[index] - '0';
        if (number > (INT32_MAX - digit) / 10)
            break;
        number = number * 10 + digit;
    }
    return number;
}

std::string HalvekFilePath(const std::wstring& path) {
    char buffer[kFilePathBytes] = {};
    // A path that does not fit is cut; the library then fails to create it and says so.
    if (::WideCharToMultiByte(CP_THREAD_ACP, 0, path.c_str(), -1, buffer, kFilePathBytes, nullptr,
                              nullptr) == 0) {
        buffer[kFilePathBytes - 1] = '\0';
    }
    return std::string(buffer, strnlen(buffer, kFilePathBytes));
}

std::wstring HalvekResultText(int32_t code) {
    switch (code) {
        case 0:
            return LoadUiText(IDS_HALVEK_NO_ERROR);
        case -101:
            return LoadUiText(IDS_SERIAL_WAIT_EXPIRED);
        case -102:
            return LoadUiText(IDS_SERIAL_INTERRUPTED_BY_USER);
        case -201:
        case -202:
        case -203:
            return LoadUiText(IDS_HALVEK_CANNOT_CREATE_FILE);
        case -204:
            return LoadUiText(IDS_HALVEK_CHECKSUM_WRONG);
        case -301:
            return LoadUiText(IDS_HALVEK_TEMPORARY_FILE_ERROR);
        case -302:
            return LoadUiText(IDS_HALVEK_POINT_NAME_WRONG);
        default:
            return LoadUiText(IDS_HALVEK_UNKNOWN_ERROR);
    }
}
