// lvconsume's checked stream calls.
#include "tools/lvconsume/stream_checks.h"

#include <string>
#include <vector>

#include "support/unique_resource.h"

namespace {

constexpr ULONG kPiece = 64 * 1024;  // what Explorer asks for in one Read

}  // namespace

bool StreamChecks::Size(ULONGLONG& size) {
    ULONGLONG start = 0;
    return Seek(STREAM_SEEK_END, L"STREAM_SEEK_END", size) &&
           Seek(STREAM_SEEK_SET, L"STREAM_SEEK_SET", start) && AtStart(start);
}

bool StreamChecks::AtStart(ULONGLONG position) {
    return position == 0 ||
           Fail(L"Seek to the start reports position " + std::to_wstring(position), E_FAIL);
}

bool StreamChecks::Stat(DWORD flags, ULONGLONG& size) {
    const wchar_t* label = flags == STATFLAG_NONAME ? L"STATFLAG_NONAME" : L"STATFLAG_DEFAULT";
    STATSTG statistics{};
    const HRESULT result = source_->Stat(&statistics, flags);
    if (result != S_OK)
        return Fail(std::wstring(L"Stat(") + label + L")", result);
    // A name given is the caller's to free, asked for or not.
    UniqueCoTaskMem name(statistics.pwcsName);
    if (flags == STATFLAG_NONAME && name)
        return Fail(L"Stat(STATFLAG_NONAME) gave a name it was not asked for", E_FAIL);
    size = statistics.cbSize.QuadPart;
    std::wstring text = std::wstring(L"Stat(") + label + L"): " + std::to_wstring(size) + L" bytes";
    if (flags != STATFLAG_NONAME) {
        text += name ? L", name " + Quoted(static_cast<const wchar_t*>(name.get()))
                     : std::wstring(L", no name");
    }
    Step(text);
    return true;
}

HRESULT StreamChecks::SeekBy0(DWORD origin, ULONGLONG& reached) noexcept {
    LARGE_INTEGER move{};
    ULARGE_INTEGER position;
    position.QuadPart = kUnset;
    const HRESULT result = source_->Seek(move, origin, &position);
    reached = position.QuadPart;
    return result;
}

bool StreamChecks::Seek(DWORD origin, const wchar_t* label, ULONGLONG& position) {
    const std::wstring call = std::wstring(L"Seek(0, ") + label + L")";
    const HRESULT result = SeekBy0(origin, position);
    if (result != S_OK)
        return Fail(call, FAILED(result) ? result : E_FAIL);
    if (position == kUnset)
        return Fail(call + L" did not report the new position", E_FAIL);
    Step(call + L": position " + std::to_wstring(position));
    return true;
}

bool StreamChecks::CopyTo(ULONGLONG wanted, ULONGLONG expected) {
    ULARGE_INTEGER count, read, written;
    count.QuadPart = wanted;
    read.QuadPart = kUnset;
    written.QuadPart = kUnset;
    const std::wstring call =
        L"CopyTo(" +
        (wanted == kAllTheRest ? std::wstring(L"ULARGE max") : std::to_wstring(wanted)) + L")";
    const HRESULT result = source_->CopyTo(file_.stream(), count, &read, &written);
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

bool StreamChecks::ReadToEnd() {
    std::vector<BYTE> buffer(kPiece);
    ULONG calls = 0;
    ULONGLONG total = 0;
    for (;;) {
        ULONG got = 0;
        // S_FALSE is how some streams say that fewer bytes than asked were left.
        const HRESULT result = source_->Read(buffer.data(), kPiece, &got);
        ++calls;
        if (FAILED(result))
            return Fail(L"Read after " + std::to_wstring(total) + L" bytes", result);
        if (got > kPiece)
            return Fail(L"Read reports " + std::to_wstring(got) + L" bytes", E_FAIL);
        if (got > 0) {
            ULONG written = 0;
            const HRESULT wrote = file_.stream()->Write(buffer.data(), got, &written);
            if (FAILED(wrote) || written != got)
                return Fail(L"writing " + file_.path(), FAILED(wrote) ? wrote : STG_E_MEDIUMFULL);
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

bool StreamChecks::Complete(ULONGLONG size) {
    if (bytes_ == size)
        return true;
    return Fail(L"the stream gave " + std::to_wstring(bytes_) + L" of the " +
                    std::to_wstring(size) + L" bytes it announced",
                E_FAIL);
}
