// Move-only owners of Win32 resources: one template, one small traits type per kind of handle.
#pragma once

#include <windows.h>
#include <commctrl.h>
#include <objbase.h>
#include <shlobj.h>

#include <utility>

template <typename Traits>
class UniqueResource {
public:
    using Type = typename Traits::Type;

    UniqueResource() noexcept = default;
    explicit UniqueResource(Type value) noexcept : value_(value) {}
    UniqueResource(const UniqueResource&) = delete;
    UniqueResource& operator=(const UniqueResource&) = delete;
    UniqueResource(UniqueResource&& other) noexcept : value_(other.release()) {}
    UniqueResource& operator=(UniqueResource&& other) noexcept {
        if (this != &other)
            reset(other.release());
        return *this;
    }
    ~UniqueResource() { reset(); }

    Type get() const noexcept { return value_; }
    explicit operator bool() const noexcept { return value_ != Traits::Invalid(); }

    // For out-parameters: frees what is held first, then hands out the slot.
    Type* put() noexcept {
        reset();
        return &value_;
    }

    [[nodiscard]] Type release() noexcept { return std::exchange(value_, Traits::Invalid()); }

    void reset(Type value = Traits::Invalid()) noexcept {
        Type old = std::exchange(value_, value);
        if (old != Traits::Invalid())
            Traits::Close(old);
    }

private:
    Type value_ = Traits::Invalid();
};

struct HandleTraits {  // null when absent: threads, events, mappings
    using Type = HANDLE;
    static Type Invalid() noexcept { return nullptr; }
    static void Close(Type value) noexcept { ::CloseHandle(value); }
};

struct FileHandleTraits {  // INVALID_HANDLE_VALUE when absent: CreateFileW
    using Type = HANDLE;
    static Type Invalid() noexcept { return INVALID_HANDLE_VALUE; }
    static void Close(Type value) noexcept { ::CloseHandle(value); }
};

struct RegKeyTraits {
    using Type = HKEY;
    static Type Invalid() noexcept { return nullptr; }
    static void Close(Type value) noexcept { ::RegCloseKey(value); }
};

struct CoTaskMemTraits {
    using Type = void*;
    static Type Invalid() noexcept { return nullptr; }
    static void Close(Type value) noexcept { ::CoTaskMemFree(value); }
};

struct LocalMemoryTraits {  // what the system allocates for its callers (FormatMessageW)
    using Type = HLOCAL;
    static Type Invalid() noexcept { return nullptr; }
    static void Close(Type value) noexcept { ::LocalFree(value); }
};

struct HGlobalTraits {
    using Type = HGLOBAL;
    static Type Invalid() noexcept { return nullptr; }
    static void Close(Type value) noexcept { ::GlobalFree(value); }
};

struct HIconTraits {
    using Type = HICON;
    static Type Invalid() noexcept { return nullptr; }
    static void Close(Type value) noexcept { ::DestroyIcon(value); }
};

struct HImageListTraits {
    using Type = HIMAGELIST;
    static Type Invalid() noexcept { return nullptr; }
    static void Close(Type value) noexcept { ::ImageList_Destroy(value); }
};

struct HModuleTraits {
    using Type = HMODULE;
    static Type Invalid() noexcept { return nullptr; }
    static void Close(Type value) noexcept { ::FreeLibrary(value); }
};

struct WindowTraits {
    using Type = HWND;
    static Type Invalid() noexcept { return nullptr; }
    static void Close(Type value) noexcept { ::DestroyWindow(value); }
};

struct MenuTraits {
    using Type = HMENU;
    static Type Invalid() noexcept { return nullptr; }
    static void Close(Type value) noexcept { ::DestroyMenu(value); }
};

struct AcceleratorTraits {
    using Type = HACCEL;
    static Type Invalid() noexcept { return nullptr; }
    static void Close(Type value) noexcept { ::DestroyAcceleratorTable(value); }
};

struct FindHandleTraits {  // FindFirstFileW
    using Type = HANDLE;
    static Type Invalid() noexcept { return INVALID_HANDLE_VALUE; }
    static void Close(Type value) noexcept { ::FindClose(value); }
};

// An item-ID list that the shell made for its caller (SHParseDisplayName, ILClone, ILCombine).
struct AbsoluteIdListTraits {
    using Type = PIDLIST_ABSOLUTE;
    static Type Invalid() noexcept { return nullptr; }
    static void Close(Type value) noexcept { ::ILFree(value); }
};

using UniqueHandle = UniqueResource<HandleTraits>;
using UniqueFileHandle = UniqueResource<FileHandleTraits>;
using UniqueRegKey = UniqueResource<RegKeyTraits>;
using UniqueCoTaskMem = UniqueResource<CoTaskMemTraits>;
using UniqueLocalMemory = UniqueResource<LocalMemoryTraits>;
using UniqueHGlobal = UniqueResource<HGlobalTraits>;
using UniqueHIcon = UniqueResource<HIconTraits>;
using UniqueHImageList = UniqueResource<HImageListTraits>;
using UniqueHModule = UniqueResource<HModuleTraits>;
using UniqueWindow = UniqueResource<WindowTraits>;  // windows of the thread that made them
using UniqueMenu = UniqueResource<MenuTraits>;
using UniqueAccelerators = UniqueResource<AcceleratorTraits>;
using UniqueFindHandle = UniqueResource<FindHandleTraits>;
using UniqueAbsoluteIdList = UniqueResource<AbsoluteIdListTraits>;

// Keeps a global memory block locked for one scope.
class GlobalLockGuard {
public:
    explicit GlobalLockGuard(HGLOBAL block) noexcept
        : block_(block), data_(block ? ::GlobalLock(block) : nullptr) {}
    GlobalLockGuard(const GlobalLockGuard&) = delete;
    GlobalLockGuard& operator=(const GlobalLockGuard&) = delete;
    ~GlobalLockGuard() {
        if (data_)
            ::GlobalUnlock(block_);
    }
    void* data() const noexcept { return data_; }
    // The block's real size: the bound for every read of data a foreign process may have written.
    SIZE_T size() const noexcept { return data_ ? ::GlobalSize(block_) : 0; }

private:
    HGLOBAL block_;
    void* data_;
};

// Owns a STGMEDIUM filled by IDataObject::GetData.
class UniqueStgMedium {
public:
    UniqueStgMedium() noexcept = default;
    UniqueStgMedium(const UniqueStgMedium&) = delete;
    UniqueStgMedium& operator=(const UniqueStgMedium&) = delete;
    ~UniqueStgMedium() { reset(); }
    STGMEDIUM* put() noexcept {
        reset();
        return &medium_;
    }
    const STGMEDIUM& get() const noexcept { return medium_; }
    // The memory block of a TYMED_HGLOBAL medium; null for any other.
    HGLOBAL global() const noexcept {
        return medium_.tymed == TYMED_HGLOBAL ? medium_.hGlobal : nullptr;
    }
    void reset() noexcept {
        if (medium_.tymed != TYMED_NULL)
            ::ReleaseStgMedium(&medium_);
        medium_ = {};
    }

private:
    STGMEDIUM medium_{};
};
