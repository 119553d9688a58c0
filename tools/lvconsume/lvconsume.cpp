// lvconsume: takes a station's file out of its data object as strictly as Windows Explorer
// consumes a virtual file, with a chosen order of stream calls; the file appears only whole.
#include <windows.h>
#include <shlobj.h>
#include <wrl/client.h>

#include <string>

#include "support/clipboard_formats.h"
#include "support/unique_resource.h"
#include "tools/common/console_output.h"
#include "tools/common/shell_copy.h"
#include "tools/lvconsume/call_orders.h"
#include "tools/lvconsume/consumer_steps.h"
#include "tools/lvconsume/id_list_reader.h"
#include "tools/lvconsume/partial_file.h"
#include "tools/lvconsume/stream_checks.h"

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

constexpr int kExitWritten = 0;
constexpr int kExitCancelled = 1;
constexpr int kExitFailed = 2;

class StrictConsumer {
public:
    StrictConsumer(std::wstring station, std::wstring folder, const NamedOrder& order)
        : station_(std::move(station)), folder_(std::move(folder)), order_(order) {}

    int Run() {
        if (!GetDataObject() || !FindTheFile(data_.Get(), failure_, file_))
            return Failed();
        const int contents = GetFileContents();
        if (contents != kExitWritten)
            return contents;
        const HRESULT created = partial_.Create(folder_);
        if (FAILED(created)) {
            failure_.Fail(L"cannot create a temporary file in " + folder_, created);
            return Failed();
        }
        Step(L"temporary file " + partial_.path());
        StreamChecks stream(contents_.get().pstm, partial_, failure_);
        if (!RunOrder(order_.order, stream))
            return Failed();
        // The stream is done with before the file is named: its temporary file goes with it.
        contents_.reset();
        const std::wstring target = folder_ + L"\\" + file_.name;
        const HRESULT committed = partial_.Commit(target);
        if (FAILED(committed)) {
            failure_.Fail(L"cannot rename the temporary file to " + target, committed);
            return Failed();
        }
        Step(L"renamed to " + target);
        Notify(CFSTR_PERFORMEDDROPEFFECT);
        Notify(CFSTR_PASTESUCCEEDED);
        PrintUtf8(L"lvconsume: wrote " + target + L": " + std::to_wstring(stream.bytes()) +
                  L" bytes, order " + order_.name + L"\n");
        return kExitWritten;
    }

private:
    int Failed() {
        partial_.Discard();
        PrintUtf8(L"lvconsume: FAILED: " + failure_.what() + L" (" + Hex(failure_.code()) +
                  L"); nothing was written\n");
        return kExitFailed;
    }

    bool GetDataObject() {
        StationFileObject object = GetStationFileDataObject(station_);
        if (!object.data)
            return failure_.Fail(object.failure, object.code);
        data_ = std::move(object.data);
        Step(L"data object of station " + Quoted(station_) + L"'s file from GetUIObjectOf");
        return true;
    }

    // Asks as Explorer does, for any of the three media; only a stream is taken.
    int GetFileContents() {
        const std::wstring call = L"FileContents (lindex " + std::to_wstring(file_.index) + L")";
        FORMATETC format = {RegisteredFormat(ClipboardFormat::FileContents), nullptr,
                            DVASPECT_CONTENT, file_.index,
                            TYMED_HGLOBAL | TYMED_ISTREAM | TYMED_ISTORAGE};
        const HRESULT result = data_->GetData(&format, contents_.put());
        if (result == S_FALSE) {
            contents_.reset();
            Step(call + L": S_FALSE");
            PrintUtf8(L"lvconsume: the download was cancelled (S_FALSE); nothing was written\n");
            return kExitCancelled;
        }
        if (result != S_OK) {
            failure_.Fail(L"\"FileContents\" (lindex " + std::to_wstring(file_.index) +
                              L") failed",
                          result);
            return Failed();
        }
        if (contents_.get().tymed != TYMED_ISTREAM || !contents_.get().pstm) {
            failure_.Fail(L"\"FileContents\" came as tymed " +
                              std::to_wstring(contents_.get().tymed) + L"; only a stream is taken",
                          DV_E_TYMED);
            return Failed();
        }
        Step(call + L": an IStream");
        return kExitWritten;
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
    NamedFile file_;
    UniqueStgMedium contents_;
    PartialFile partial_;
    FailureRecord failure_;
};

}  // namespace

int wmain(int argc, wchar_t** argv) {
    if (argc == 2 && argv[1] == std::wstring(L"--help")) {
        PrintUtf8(kUsage);
        return 0;
    }
    const NamedOrder* order =
        argc == 5 && argv[3] == std::wstring(L"--order") ? FindOrder(argv[4]) : nullptr;
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
