// String-table access, translation-file search and the process-wide translation cache.
#include "support/text_lookup.h"

#include <shlwapi.h>

#include <atomic>
#include <clocale>
#include <cstdint>
#include <map>
#include <memory>
#include <mutex>
#include <new>
#include <utility>

#include "support/module_instance.h"
#include "support/read_only_file.h"
#include "support/portable/translation_text.h"
#include "support/unique_resource.h"

namespace {

// A read-only view of a mapped file.
class MappedView {
public:
    explicit MappedView(const void* data) noexcept : data_(data) {}
    MappedView(const MappedView&) = delete;
    MappedView& operator=(const MappedView&) = delete;
    ~MappedView() {
        if (data_)
            ::UnmapViewOfFile(data_);
    }
    const uint8_t* bytes() const noexcept { return static_cast<const uint8_t*>(data_); }

private:
    const void* data_;
};

// Built once per process on first use and never torn down before the module goes. The lock
// guards only the two maps; a loaded map is shared read-only with every caller.
struct TranslationCache {
    std::mutex lock;
    std::map<std::pair<std::wstring, LANGID>, std::wstring> fileByModuleAndLanguage;
    std::map<std::wstring, std::shared_ptr<const TranslationMap>> mapByFile;
};

// Made once, on first use from any thread, and never destroyed: callers may still be about at
// unload. A one-time initialisation of the system's rather than a function-local static or
// std::call_once: with this runtime both leave a handle and a TLS slot behind at every load of
// the library, which a host that loads and frees it again and again would run out of.
INIT_ONCE g_cacheOnce = INIT_ONCE_STATIC_INIT;
TranslationCache* g_cache = nullptr;

BOOL CALLBACK MakeCache(INIT_ONCE*, void*, void**) {
    g_cache = new (std::nothrow) TranslationCache;
    return g_cache != nullptr;  // out of memory: tried again on the next use
}

TranslationCache& Cache() {
    if (!::InitOnceExecuteOnce(&g_cacheOnce, &MakeCache, nullptr, nullptr))
        throw std::bad_alloc();
    return *g_cache;
}

std::shared_ptr<const TranslationMap> TranslationsFor(const std::wstring& modulePath,
                                                      LANGID language) {
    TranslationCache& cache = Cache();
    std::lock_guard<std::mutex> guard(cache.lock);
    const auto key = std::make_pair(modulePath, language);
    auto file = cache.fileByModuleAndLanguage.find(key);
    if (file == cache.fileByModuleAndLanguage.end())
        file = cache.fileByModuleAndLanguage.emplace(key, FindTranslationFile(modulePath, language))
                   .first;
    if (file->second.empty())
        return nullptr;
    auto loaded = cache.mapByFile.find(file->second);
    if (loaded == cache.mapByFile.end()) {
        // A file that fails to load is remembered empty: it is read once per process either way.
        auto map = std::make_shared<TranslationMap>();
        if (FAILED(LoadTranslationFile(file->second, *map)))
            map->clear();
        loaded = cache.mapByFile.emplace(file->second, std::move(map)).first;
    }
    return loaded->second;
}

std::wstring LocaleName(LANGID language) {
    wchar_t name[LOCALE_NAME_MAX_LENGTH] = {};  // 85 characters with the terminator
    if (::LCIDToLocaleName(MAKELCID(language, SORT_DEFAULT), name, LOCALE_NAME_MAX_LENGTH, 0) == 0)
        return {};
    return name;
}

bool FileExists(const std::wstring& path) {
    return ::PathFileExistsW(path.c_str()) != FALSE;
}

std::wstring WithoutNote(const std::wstring& text) {
    return std::wstring(CutTranslatorNote(text));
}

}  // namespace

std::wstring LoadEnglishString(HMODULE module, UINT id) {
    // Strings live in blocks of 16; block n holds ids (n - 1) * 16 to n * 16 - 1.
    const HRSRC resource =
        ::FindResourceExW(module, RT_STRING, MAKEINTRESOURCEW(id / 16 + 1), kEnglishLanguage);
    if (!resource)
        return {};
    const HGLOBAL loaded = ::LoadResource(module, resource);
    const DWORD size = ::SizeofResource(module, resource);
    const auto* block = static_cast<const WCHAR*>(loaded ? ::LockResource(loaded) : nullptr);
    if (!block)
        return {};
    // Each entry is a length word followed by that many characters; walk within the block's size.
    const size_t units = size / sizeof(WCHAR);
    size_t offset = 0;
    for (UINT index = 0; index < id % 16; ++index) {
        if (offset >= units)
            return {};
        offset += 1 + block[offset];
    }
    if (offset >= units)
        return {};
    const size_t length = block[offset];
    if (offset + 1 + length > units)
        return {};
    return std::wstring(block + offset + 1, length);
}

std::wstring LoadText(HMODULE module, UINT id, LANGID targetLanguage) {
    const std::wstring english = LoadEnglishString(module, id);
    if (english.empty())
        return english;
    return TranslateText(english, kEnglishLanguage, targetLanguage, module);
}

std::wstring TranslateText(const std::wstring& english, LANGID sourceLanguage,
                           LANGID targetLanguage, HMODULE module) {
    if (english.empty() || sourceLanguage == targetLanguage)
        return WithoutNote(english);
    std::wstring modulePath(MAX_PATH, L'\0');
    const DWORD length =
        ::GetModuleFileNameW(module, modulePath.data(), static_cast<DWORD>(modulePath.size()));
    if (length == 0 || length >= modulePath.size())
        return WithoutNote(english);
    modulePath.resize(length);
    return TranslateTextForModulePath(english, sourceLanguage, targetLanguage, modulePath);
}

std::wstring TranslateTextForModulePath(const std::wstring& english, LANGID sourceLanguage,
                                        LANGID targetLanguage, const std::wstring& modulePath) {
    if (english.empty() || sourceLanguage == targetLanguage)
        return WithoutNote(english);
    const std::shared_ptr<const TranslationMap> translations =
        TranslationsFor(modulePath, targetLanguage);
    if (translations) {
        const auto entry = translations->find(english);
        if (entry != translations->end() && !entry->second.empty())
            return entry->second;
    }
    return WithoutNote(english);
}

std::wstring FindTranslationFile(const std::wstring& modulePath, LANGID language) {
    const size_t slash = modulePath.find_last_of(L"\\/");
    const std::wstring directory =
        slash == std::wstring::npos ? std::wstring() : modulePath.substr(0, slash + 1);
    std::wstring baseName = slash == std::wstring::npos ? modulePath : modulePath.substr(slash + 1);
    const size_t dot = baseName.find_last_of(L'.');
    if (dot != std::wstring::npos)
        baseName.resize(dot);
    const std::wstring locale = LocaleName(language);

    std::wstring candidates[4];
    if (!locale.empty())
        candidates[0] = directory + locale + L"\\" + baseName + L".txt";
    candidates[1] = directory + baseName + L".txt";
    if (!locale.empty())
        candidates[2] = directory + locale + L"\\ShellExt.txt";
    candidates[3] = directory + L"ShellExt.txt";
    for (const std::wstring& candidate : candidates) {
        if (!candidate.empty() && FileExists(candidate))
            return candidate;
    }
    return {};
}

HRESULT LoadTranslationFile(const std::wstring& path, TranslationMap& map) noexcept try {
    UniqueFileHandle file;
    uint64_t size = 0;
    // No file for the user's language is the usual case, not a failure worth logging.
    const HRESULT opened = OpenReadOnlyFile(path, file, size);
    if (FAILED(opened))
        return opened;
    // An empty file cannot be mapped at all; a one-byte file holds no character.
    if (size < 2)
        return E_FAIL;
    if (size > 0x7FFFFFFF)
        return E_OUTOFMEMORY;
    UniqueHandle mapping(::CreateFileMappingW(file.get(), nullptr, PAGE_READONLY, 0, 0, nullptr));
    if (!mapping)
        return HRESULT_FROM_WIN32(::GetLastError());
    MappedView view(::MapViewOfFile(mapping.get(), FILE_MAP_READ, 0, 0, 0));
    if (!view.bytes())
        return HRESULT_FROM_WIN32(::GetLastError());
    return ParseTranslationFile(view.bytes(), static_cast<size_t>(size), map) ? S_OK : E_FAIL;
} catch (const std::bad_alloc&) {
    return E_OUTOFMEMORY;
} catch (...) {
    return E_FAIL;
}

void ClearTranslationCache() noexcept {
    if (!::InitOnceExecuteOnce(&g_cacheOnce, &MakeCache, nullptr, nullptr))
        return;  // no cache: nothing to clear
    TranslationCache& cache = *g_cache;
    std::lock_guard<std::mutex> guard(cache.lock);
    cache.fileByModuleAndLanguage.clear();
    cache.mapByFile.clear();
}

// The language chosen on a thread, remembered here as well: not every system reports a language
// set with SetThreadUILanguage back through GetThreadUILanguage (Wine does not). It is kept in a
// system TLS slot, which costs no allocation: a C++ thread_local is allocated for every thread
// that touches it, every download thread among them, and its clean-up is left to the thread
// notifications that this module turns off. The slot is taken only by a thread that selects a
// language (a test, a tool), once per load, and lives as long as the process.
INIT_ONCE g_slotOnce = INIT_ONCE_STATIC_INIT;
std::atomic<DWORD> g_languageSlot{TLS_OUT_OF_INDEXES};

BOOL CALLBACK AllocateLanguageSlot(INIT_ONCE*, void*, void**) {
    g_languageSlot = ::TlsAlloc();
    return TRUE;  // a slot that could not be had leaves the system's language in charge
}

// The slot, taken on first need; TLS_OUT_OF_INDEXES when none could be had.
DWORD LanguageSlot() noexcept {
    (void)::InitOnceExecuteOnce(&g_slotOnce, &AllocateLanguageSlot, nullptr, nullptr);
    return g_languageSlot;
}

LANGID UiLanguage() noexcept {
    // Only read: a thread that never selected a language takes no slot.
    const DWORD slot = g_languageSlot;
    const auto selected = static_cast<LANGID>(
        slot != TLS_OUT_OF_INDEXES ? reinterpret_cast<uintptr_t>(::TlsGetValue(slot)) : 0);
    return selected != 0 ? selected : ::GetThreadUILanguage();
}

bool SelectThreadUiLanguage(LANGID language) noexcept {
    if (::SetThreadUILanguage(language) != language)
        return false;
    const DWORD slot = LanguageSlot();
    if (slot != TLS_OUT_OF_INDEXES)
        (void)::TlsSetValue(slot, reinterpret_cast<void*>(static_cast<uintptr_t>(language)));
    return true;
}

bool SelectUiLanguage(LANGID language) noexcept {
    const bool selected = SelectThreadUiLanguage(language);

    // Older systems lack the process-wide preference; the thread's language is enough there.
    using SetPreferred = BOOL(WINAPI*)(DWORD, PCZZWSTR, PULONG);
    const HMODULE kernel = ::GetModuleHandleW(L"kernel32.dll");
    const auto setPreferred = kernel
                                  ? reinterpret_cast<SetPreferred>(reinterpret_cast<void*>(
                                        ::GetProcAddress(kernel, "SetProcessPreferredUILanguages")))
                                  : nullptr;
    if (setPreferred) {
        wchar_t list[8] = {};  // "%04X", then the empty string that ends the list
        ::wsprintfW(list, L"%04X", language);
        ULONG count = 0;
        (void)setPreferred(MUI_LANGUAGE_ID, list,
                           &count);  // a preference only: failure is harmless
    }
    const std::wstring locale = LocaleName(language);
    if (!locale.empty())
        (void)_wsetlocale(LC_ALL, locale.c_str());  // the runtime may not know the name: harmless
    return selected;
}

std::wstring LoadUiText(UINT id) {
    return LoadText(ThisModule(), id, UiLanguage());
}

std::wstring TranslateUiText(const std::wstring& english) {
    return TranslateText(english, kEnglishLanguage, UiLanguage(), ThisModule());
}
