// lvconsume: takes a station's file out of its data object as strictly as Windows Explorer
// consumes a virtual file, with a chosen order of stream calls; the file appears only whole.
#include <windows.h>
#include <shlobj.h>
#include <shlwapi.h>
#include <shobjidl.h>
#include <wrl/client.h>

#include <cstdint>
#include <cstdio>
#include <cwchar>
#include <string>
#include <vector>

#include "support/clipboard_formats.h"
#include "support/unique_resource.h"
#include "tools/common/console_output.h"
#include "tools/common/shell_copy.h"
#include "tools/lvconsume/portable/strict_id_list_array.h"

using Microsoft::WRL::ComPtr;

namespace {

const wchar_t kUsage[] =
    L"Usage: lvconsume STATION FOLDER --order NAME\n"
    L"Downloads the data file of the station named STATION into FOLDER through its data object,\n"
    L"reading it as Windows Explorer does and checking every answer on the way. NAME is the\n"
    L"order of the stream calls:\n"
    L"  stat-seek-read  Stat (with and without name), Seek to the end and back, Read 64 KiB pieces\n"
    L"  seek-copyto     Seek to the end and back, CopyTo the file in one call\n"
    L"  read-only       Read 64 KiB pieces until a short read, nothing else\n"
    L"  copyto-halves   Seek to the end and back, CopyTo the first half, then the rest\n"
    L"  stat-after      Read to the end, then Stat (the size) and Seek to the start (must fail)\n"
    L"The file appears under its own name only when every byte arrived.\n"
    L"Exit codes: 0 written, 1 the download was cancelled, 2 failure.\n";

enum class Order { kStatSeekRead, kSeekCopyTo, kReadOnly, kCopyToHalves, kStatAfter };

struct NamedOrder {
    const wchar_t* name;
    Order order;
};

const NamedOrder kOrders[] = {
    {L"stat-seek-read", Order::kStatSeekRead}, {L"seek-copyto", Order::kSeekCopyTo},
    {L"read-only", Order::kReadOnly},          {L"copyto-halves", Order::kCopyToHalves},
    {L"stat-after", Order::kStatAfter},
};

constexpr ULONG kPiece = 64 * 1024;  // what Explorer asks for in one Read
constexpr ULONGLONG kUnset = ~0ULL;  // a position or count that the callee did not write
constexpr ULONGLONG kAllTheRest = ~0ULL;  // CopyTo's count for "up to the end"
constexpr int kExitWritten = 0;
constexpr int kExitCancelled = 1;
constexpr int kExitFailed = 2;

std::wstring Hex(HRESULT code) {
    wchar_t text[16];
    swprintf(text, ARRAYSIZE(text), L"0x%08lX", static_cast<unsigned long>(code));
    return text;
}

std::wstring Quoted(const std::wstring& text) {
    return L"\"" + text + L"\"";
}

void Step(const std::wstring& text) {
    PrintUtf8(L"step: " + text + L"\n");
}

// The download's file in the target folder under a temporary name, renamed to its own name only
// once it is complete: any other end deletes it, so that a short download never looks like a file.
class PartialFile {
public:
    PartialFile() = default;
    PartialFile(const PartialFile&) = delete;
    PartialFile& operator=(const PartialFile&) = delete;
    ~PartialFile() { Discard(); }

    HRESULT Create(const std::wstring& folder) {
        wchar_t name[MAX_PATH];
        if (::GetTempFileNameW(folder.c_str(), L"lvc", 0, name) == 0)
            return HRESULT_FROM_WIN32(::GetLastError());
        path_ = name;  // the placeholder exists from here on: Discard removes it
        return ::SHCreateStreamOnFileEx(path_.c_str(), STGM_CREATE | STGM_WRITE,
                                        FILE_ATTRIBUTE_NORMAL, TRUE, nullptr, &stream_);
    }
    const std::wstring& path() const { return path_; }
    IStream* stream() const { return stream_.Get(); }

    // Closes the file and gives it its final name, replacing a file of that name.
    HRESULT Commit(const std::wstring& target) {
        stream_.Reset();
        if (!::MoveFileExW(path_.c_str(), target.c_str(), MOVEFILE_REPLACE_EXISTING))
            return HRESULT_FROM_WIN32(::GetLastError());
        path_.clear();
        return S_OK;
    }

    void Discard() noexcept {
        stream_.Reset();
        if (!path_.empty())
            (void)::DeleteFileW(path_.c_str());  // a leftover is reported by whoever looks
        path_.clear();
    }

private:
    std::wstring path_;
    ComPtr<IStream> stream_;
};

class StrictConsumer {
public:
    StrictConsumer(std::wstring station, std::wstring folder, const NamedOrder& order)
        : station_(std::move(station)), folder_(std::move(folder)), order_(order) {}

    int Run() {
        if (!GetDataObject() || !ReadIdListArrayStrictlyStep() || !ReadIdListArrayThroughShell() ||
            !ReadFileGroupDescriptor() || !SameFileInBothFormats()) {
            return Failed();
        }
        const int contents = GetFileContents();
        if (contents != kExitWritten)
            return contents;
        const HRESULT created = file_.Create(folder_);
        if (FAILED(created)) {
            Fail(L"cannot create a temporary file in " + folder_, created);
            return Failed();
        }
        Step(L"temporary file " + file_.path());
        if (!RunOrder())
            return Failed();
        // The stream is done with before the file is named: its temporary file goes with it.
        contents_.reset();
        const std::wstring target = folder_ + L"\\" + fileName_;
        const HRESULT committed = file_.Commit(target);
        if (FAILED(committed)) {
            Fail(L"cannot rename the temporary file to " + target, committed);
            return Failed();
        }
        Step(L"renamed to " + target);
        Notify(CFSTR_PERFORMEDDROPEFFECT);
        Notify(CFSTR_PASTESUCCEEDED);
        PrintUtf8(L"lvconsume: wrote " + target + L": " + std::to_wstring(bytes_) +
                  L" bytes, order " + order_.name + L"\n");
        return kExitWritten;
    }

private:
    bool Fail(const std::wstring& what, HRESULT code) {
        failure_ = what;
        failureCode_ = code;
        return false;
    }

    int Failed() {
        file_.Discard();
        PrintUtf8(L"lvconsume: FAILED: " + failure_ + L" (" + Hex(failureCode_) +
                  L"); nothing was written\n");
        return kExitFailed;
    }

    bool GetDataObject() {
        StationFileObject object = GetStationFileDataObject(station_);
        if (!object.data)
            return Fail(object.failure, object.code);
        data_ = std::move(object.data);
        Step(L"data object of station " + Quoted(station_) + L"'s file from GetUIObjectOf");
        return true;
    }

    // Every offset and every item-ID list must lie inside the block that GlobalSize measures.
    bool ReadIdListArrayStrictlyStep() {
        FORMATETC format = {RegisteredFormat(ClipboardFormat::ShellIdList), nullptr,
                            DVASPECT_CONTENT, -1, TYMED_HGLOBAL};
        UniqueStgMedium medium;
        const HRESULT result = data_->GetData(&format, medium.put());
        if (result != S_OK || !medium.global())
            return Fail(L"\"Shell IDList Array\" is not given as a memory block", result);
        GlobalLockGuard lock(medium.global());
        if (!lock.data())
            return Fail(L"\"Shell IDList Array\" cannot be locked", E_HANDLE);
        const StrictIdListArray array =
            ReadIdListArrayStrictly(static_cast<const uint8_t*>(lock.data()), lock.size());
        if (!array.valid()) {
            return Fail(L"\"Shell IDList Array\" (" + std::to_wstring(lock.size()) +
                            L" bytes): " + std::wstring(array.fault.begin(), array.fault.end()),
                        E_FAIL);
        }
        if (array.childCount != 1) {
            return Fail(L"\"Shell IDList Array\" names " + std::to_wstring(array.childCount) +
                            L" items for one file",
                        E_FAIL);
        }
        if (array.lists[1].length <= 2)
            return Fail(L"\"Shell IDList Array\" gives the file an empty item-ID list", E_FAIL);
        childCount_ = array.childCount;
        Step(L"Shell IDList Array, strictly: cidl " + std::to_wstring(array.childCount) + L", " +
             std::to_wstring(lock.size()) + L"-byte block, parent list " +
             std::to_wstring(array.lists[0].length) + L" bytes, file list " +
             std::to_wstring(array.lists[1].length) + L" bytes, all inside");
        return true;
    }

    // The system's own reading: one shell item per child, each with names it can give.
    bool ReadIdListArrayThroughShell() {
        ComPtr<IShellItemArray> items;
        HRESULT result = ::SHCreateShellItemArrayFromDataObject(data_.Get(), IID_PPV_ARGS(&items));
        if (FAILED(result))
            return Fail(L"SHCreateShellItemArrayFromDataObject", result);
        DWORD count = 0;
        result = items->GetCount(&count);
        if (FAILED(result))
            return Fail(L"IShellItemArray::GetCount", result);
        if (count != childCount_) {
            return Fail(L"the system reads " + std::to_wstring(count) + L" items; cidl says " +
                            std::to_wstring(childCount_),
                        E_FAIL);
        }
        for (DWORD index = 0; index < count; ++index) {
            ComPtr<IShellItem> item;
            result = items->GetItemAt(index, &item);
            if (FAILED(result))
                return Fail(L"IShellItemArray::GetItemAt(" + std::to_wstring(index) + L")", result);
            UniqueCoTaskMem parsing;
            result = item->GetDisplayName(SIGDN_DESKTOPABSOLUTEPARSING,
                                          reinterpret_cast<wchar_t**>(parsing.put()));
            if (FAILED(result) || !parsing)
                return Fail(L"item " + std::to_wstring(index) + L" has no parsing name", result);
            UniqueCoTaskMem display;
            result = item->GetDisplayName(SIGDN_NORMALDISPLAY,
                                          reinterpret_cast<wchar_t**>(display.put()));
            if (FAILED(result) || !display)
                return Fail(L"item " + std::to_wstring(index) + L" has no display name", result);
            Step(L"Shell IDList Array, through the system: item " + std::to_wstring(index) + L" " +
                 Quoted(static_cast<const wchar_t*>(parsing.get())) + L", shown as " +
                 Quoted(static_cast<const wchar_t*>(display.get())));
            shellItemNames_.emplace_back(static_cast<const wchar_t*>(display.get()));
        }
        return true;
    }

    // Names that the system can fetch are not enough: they must be the file's. A parent list that
    // is not fully qualified from the desktop gives the system some other item, and a paste would
    // then work on that item.
    bool SameFileInBothFormats() {
        const size_t index = static_cast<size_t>(fileIndex_);
        const std::wstring shown = index < shellItemNames_.size() ? shellItemNames_[index] : L"";
        if (shown != fileName_) {
            return Fail(L"the system takes \"Shell IDList Array\" item " + std::to_wstring(index) +
                            L" for " + Quoted(shown) + L", not the file " + Quoted(fileName_) +
                            L" (is aoffset[0] the parent's list from the desktop?)",
                        E_FAIL);
        }
        Step(L"Shell IDList Array and FileGroupDescriptorW name the same file");
        return true;
    }

    // The block must hold every record that cItems announces; the file is the first record with
    // a usable name, and its position is the lindex of its contents.
    bool ReadFileGroupDescriptor() {
        FORMATETC format = {RegisteredFormat(ClipboardFormat::FileGroupDescriptor), nullptr,
                            DVASPECT_CONTENT, -1, TYMED_HGLOBAL};
        UniqueStgMedium medium;
        const HRESULT result = data_->GetData(&format, medium.put());
        if (result != S_OK || !medium.global())
            return Fail(L"\"FileGroupDescriptorW\" is not given as a memory block", result);
        GlobalLockGuard lock(medium.global());
        if (!lock.data() || lock.size() < sizeof(UINT))
            return Fail(L"\"FileGroupDescriptorW\" has no room for cItems", E_FAIL);
        const auto* group = static_cast<const FILEGROUPDESCRIPTORW*>(lock.data());
        const ULONGLONG needed = offsetof(FILEGROUPDESCRIPTORW, fgd) +
                                 static_cast<ULONGLONG>(group->cItems) * sizeof(FILEDESCRIPTORW);
        if (group->cItems == 0 || needed > lock.size()) {
            return Fail(L"\"FileGroupDescriptorW\": cItems " + std::to_wstring(group->cItems) +
                            L" needs " + std::to_wstring(needed) + L" bytes; the block has " +
                            std::to_wstring(lock.size()),
                        E_FAIL);
        }
        for (UINT index = 0; index < group->cItems; ++index) {
            const FILEDESCRIPTORW& record = group->fgd[index];
            const size_t length = wcsnlen(record.cFileName, MAX_PATH);
            const std::wstring name(record.cFileName, length);
            const bool directory = (record.dwFlags & FD_ATTRIBUTES) != 0 &&
                                   (record.dwFileAttributes & FILE_ATTRIBUTE_DIRECTORY) != 0;
            if (directory || length == 0 || length == MAX_PATH || name == L"." || name == L".." ||
                name.find_first_of(L"\\/:*?\"<>|") != std::wstring::npos) {
                continue;
            }
            fileName_ = name;
            fileIndex_ = static_cast<LONG>(index);
            Step(L"FileGroupDescriptorW: " + std::to_wstring(group->cItems) + L" record(s) in a " +
                 std::to_wstring(lock.size()) + L"-byte block; " + Quoted(fileName_) +
                 L" at index " + std::to_wstring(fileIndex_));
            return true;
        }
        return Fail(L"\"FileGroupDescriptorW\" names no file that can be written", E_FAIL);
    }

    // Asks as Explorer does, for any of the three media; only a stream is taken.
    int GetFileContents() {
        FORMATETC format = {RegisteredFormat(ClipboardFormat::FileContents), nullptr,
                            DVASPECT_CONTENT, fileIndex_,
                            TYMED_HGLOBAL | TYMED_ISTREAM | TYMED_ISTORAGE};
        const HRESULT result = data_->GetData(&format, contents_.put());
        if (result == S_FALSE) {
            contents_.reset();
            Step(L"FileContents (lindex " + std::to_wstring(fileIndex_) + L"): S_FALSE");
            PrintUtf8(L"lvconsume: the download was cancelled (S_FALSE); nothing was written\n");
            return kExitCancelled;
        }
        if (result != S_OK) {
            Fail(L"\"FileContents\" (lindex " + std::to_wstring(fileIndex_) + L") failed", result);
            return Failed();
        }
        if (contents_.get().tymed != TYMED_ISTREAM || !contents_.get().pstm) {
            Fail(L"\"FileContents\" came as tymed " + std::to_wstring(contents_.get().tymed) +
                     L"; only a stream is taken",
                 DV_E_TYMED);
            return Failed();
        }
        Step(L"FileContents (lindex " + std::to_wstring(fileIndex_) + L"): an IStream");
        return kExitWritten;
    }

    IStream* source() const { return contents_.get().pstm; }

    bool RunOrder() {
        switch (order_.order) {
            case Order::kStatSeekRead:
                return RunStatSeekRead();
            case Order::kSeekCopyTo:
                return RunSeekCopyTo();
            case Order::kReadOnly:
                return ReadToEnd();
            case Order::kCopyToHalves:
                return RunCopyToHalves();
            case Order::kStatAfter:
                return RunStatAfter();
        }
        return Fail(L"unknown order", E_INVALIDARG);
    }

    bool RunStatSeekRead() {
        ULONGLONG named = 0, unnamed = 0, end = 0, start = 0;
        if (!Stat(STATFLAG_DEFAULT, named) || !Stat(STATFLAG_NONAME, unnamed))
            return false;
        if (named != unnamed) {
            return Fail(L"Stat gives " + std::to_wstring(named) + L" bytes with its name and " +
                            std::to_wstring(unnamed) + L" without",
                        E_FAIL);
        }
        if (!Seek(STREAM_SEEK_END, L"STREAM_SEEK_END", end))
            return false;
        if (end != named) {
            return Fail(L"Seek to the end reports " + std::to_wstring(end) + L" bytes; Stat " +
                            std::to_wstring(named),
                        E_FAIL);
        }
        if (!Seek(STREAM_SEEK_SET, L"STREAM_SEEK_SET", start) || !AtStart(start))
            return false;
        return ReadToEnd() && Complete(named);
    }

    bool RunSeekCopyTo() {
        ULONGLONG size = 0;
        return Size(size) && CopyTo(size, size) && Complete(size);
    }

    bool RunCopyToHalves() {
        ULONGLONG size = 0;
        return Size(size) && CopyTo(size / 2, size / 2) && CopyTo(kAllTheRest, size - size / 2) &&
               Complete(size);
    }

    bool RunStatAfter() {
        ULONGLONG size = 0, position = kUnset;
        if (!ReadToEnd() || !Stat(STATFLAG_NONAME, size) || !Complete(size))
            return false;
        // After the last byte the stream's temporary file is gone: there is nothing to go back to.
        const HRESULT result = SeekBy0(STREAM_SEEK_SET, position);
        if (result != STG_E_INVALIDFUNCTION) {
            return Fail(L"Seek(0, STREAM_SEEK_SET) after the end answered " + Hex(result) +
                            L", not STG_E_INVALIDFUNCTION",
                        FAILED(result) ? result : E_FAIL);
        }
        Step(L"Seek(0, STREAM_SEEK_SET) after the end: STG_E_INVALIDFUNCTION");
        return true;
    }

    // The size by seeking to the end, then back to the start.
    bool Size(ULONGLONG& size) {
        ULONGLONG start = 0;
        return Seek(STREAM_SEEK_END, L"STREAM_SEEK_END", size) &&
               Seek(STREAM_SEEK_SET, L"STREAM_SEEK_SET", start) && AtStart(start);
    }

    bool AtStart(ULONGLONG position) {
        return position == 0 ||
               Fail(L"Seek to the start reports position " + std::to_wstring(position), E_FAIL);
    }

    bool Stat(DWORD flags, ULONGLONG& size) {
        const wchar_t* label = flags == STATFLAG_NONAME ? L"STATFLAG_NONAME" : L"STATFLAG_DEFAULT";
        STATSTG statistics{};
        const HRESULT result = source()->Stat(&statistics, flags);
        if (result != S_OK)
            return Fail(std::wstring(L"Stat(") + label + L")", result);
        // A name given is the caller's to free, asked for or not.
        UniqueCoTaskMem name(statistics.pwcsName);
        if (flags == STATFLAG_NONAME && name)
            return Fail(L"Stat(STATFLAG_NONAME) gave a name it was not asked for", E_FAIL);
        size = statistics.cbSize.QuadPart;
        std::wstring text = std::wstring(L"Stat(") + label + L"): " + std::to_wstring(size) +
                            L" bytes";
        if (flags != STATFLAG_NONAME) {
            text += name ? L", name " + Quoted(static_cast<const wchar_t*>(name.get()))
                         : std::wstring(L", no name");
        }
        Step(text);
        return true;
    }

    // Seeks by 0 from origin; reached stays kUnset when the stream does not write it.
    HRESULT SeekBy0(DWORD origin, ULONGLONG& reached) {
        LARGE_INTEGER move{};
        ULARGE_INTEGER position;
        position.QuadPart = kUnset;
        const HRESULT result = source()->Seek(move, origin, &position);
        reached = position.QuadPart;
        return result;
    }

    // A seek that must succeed and write back the position it reached.
    bool Seek(DWORD origin, const wchar_t* label, ULONGLONG& position) {
        const std::wstring call = std::wstring(L"Seek(0, ") + label + L")";
        const HRESULT result = SeekBy0(origin, position);
        if (result != S_OK)
            return Fail(call, FAILED(result) ? result : E_FAIL);
        if (position == kUnset)
            return Fail(call + L" did not report the new position", E_FAIL);
        Step(call + L": position " + std::to_wstring(position));
        return true;
    }

    // One CopyTo into the file; read and written must both be what the stream still holds.
    bool CopyTo(ULONGLONG wanted, ULONGLONG expected) {
        ULARGE_INTEGER count, read, written;
        count.QuadPart = wanted;
        read.QuadPart = kUnset;
        written.QuadPart = kUnset;
        const std::wstring call =
            L"CopyTo(" +
            (wanted == kAllTheRest ? std::wstring(L"ULARGE max") : std::to_wstring(wanted)) + L")";
        const HRESULT result = source()->CopyTo(file_.stream(), count, &read, &written);
        if (result != S_OK)
            return Fail(call, result);
        if (read.QuadPart != expected || written.QuadPart != expected) {
            return Fail(call + L" read " + std::to_wstring(read.QuadPart) + L" and wrote " +
                            std::to_wstring(written.QuadPart) + L" bytes; " +
                            std::to_wstring(expected) + L" were due",
                        E_FAIL);
        }
        bytes_ += written.QuadPart;
        Step(call + L": read " + std::to_wstring(read.QuadPart) + L", written " +
             std::to_wstring(written.QuadPart));
        return true;
    }

    // Reads 64 KiB pieces into the file; a read that returns fewer bytes than asked is the end.
    bool ReadToEnd() {
        std::vector<BYTE> buffer(kPiece);
        ULONG calls = 0;
        ULONGLONG total = 0;
        for (;;) {
            ULONG got = 0;
            // S_FALSE is how some streams say that fewer bytes than asked were left.
            const HRESULT result = source()->Read(buffer.data(), kPiece, &got);
            ++calls;
            if (FAILED(result))
                return Fail(L"Read after " + std::to_wstring(total) + L" bytes", result);
            if (got > kPiece)
                return Fail(L"Read reports " + std::to_wstring(got) + L" bytes", E_FAIL);
            if (got > 0) {
                ULONG written = 0;
                const HRESULT wrote = file_.stream()->Write(buffer.data(), got, &written);
                if (FAILED(wrote) || written != got) {
                    return Fail(L"writing " + file_.path(),
                                FAILED(wrote) ? wrote : STG_E_MEDIUMFULL);
                }
            }
            total += got;
            if (got < kPiece)
                break;
        }
        bytes_ += total;
        Step(L"Read: " + std::to_wstring(total) + L" bytes in " + std::to_wstring(calls) +
             L" call(s)");
        return true;
    }

    // A stream that ended before the size it announced is a failure, never a file.
    bool Complete(ULONGLONG size) {
        if (bytes_ == size)
            return true;
        return Fail(L"the stream gave " + std::to_wstring(bytes_) + L" of the " +
                        std::to_wstring(size) + L" bytes it announced",
                    E_FAIL);
    }

    // Tells the object what the paste did, in a block that the object then owns. Explorer goes
    // on whatever the answer, and so does this: a refusal is printed, not a failure.
    void Notify(const wchar_t* formatName) {
        const std::wstring call = std::wstring(L"SetData(") + Quoted(formatName) +
                                  L", DROPEFFECT_COPY)";
        UniqueHGlobal block(::GlobalAlloc(GMEM_MOVEABLE, sizeof(DWORD)));
        {
            GlobalLockGuard lock(block.get());
            if (!lock.data()) {
                Step(call + L": not sent, no memory");
                return;
            }
            *static_cast<DWORD*>(lock.data()) = DROPEFFECT_COPY;
        }
        FORMATETC format = {RegisteredClipboardFormat(formatName), nullptr, DVASPECT_CONTENT, -1,
                            TYMED_HGLOBAL};
        STGMEDIUM medium{};
        medium.tymed = TYMED_HGLOBAL;
        medium.hGlobal = block.get();
        medium.pUnkForRelease = nullptr;
        const HRESULT result = data_->SetData(&format, &medium, TRUE);
        // The object owns a block it accepted; a refused block is still the caller's to free.
        if (SUCCEEDED(result))
            (void)block.release();
        Step(call + L": " + Hex(result));
    }

    const std::wstring station_;
    const std::wstring folder_;
    const NamedOrder order_;
    ComPtr<IDataObject> data_;
    UINT childCount_ = 0;
    std::vector<std::wstring> shellItemNames_;  // as the system shows the items of the CIDA
    std::wstring fileName_;
    LONG fileIndex_ = -1;
    UniqueStgMedium contents_;
    PartialFile file_;
    ULONGLONG bytes_ = 0;  // written into the file so far
    std::wstring failure_;
    HRESULT failureCode_ = S_OK;
};

}  // namespace

int wmain(int argc, wchar_t** argv) {
    if (argc == 2 && argv[1] == std::wstring(L"--help")) {
        PrintUtf8(kUsage);
        return 0;
    }
    const NamedOrder* order = nullptr;
    if (argc == 5 && argv[3] == std::wstring(L"--order")) {
        for (const NamedOrder& known : kOrders) {
            if (argv[4] == std::wstring(known.name))
                order = &known;
        }
    }
    if (!order) {
        PrintUtf8(kUsage);
        return kExitFailed;
    }
    wchar_t full[MAX_PATH];
    if (::GetFullPathNameW(argv[2], MAX_PATH, full, nullptr) == 0) {
        PrintUtf8(L"lvconsume: bad folder " + std::wstring(argv[2]) + L"\n");
        return kExitFailed;
    }
    std::wstring folder = full;
    if (!folder.empty() && folder.back() == L'\\')
        folder.pop_back();
    if (FAILED(::OleInitialize(nullptr))) {
        PrintUtf8(L"lvconsume: OLE could not start\n");
        return kExitFailed;
    }
    int code = kExitFailed;
    {
        // Every COM object of the run goes before OLE does.
        StrictConsumer consumer(argv[1], folder, *order);
        code = consumer.Run();
    }
    ::OleUninitialize();
    return code;
}
