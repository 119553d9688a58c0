// lvconsume's stream calls, each checked against what Explorer relies on: the positions a seek
// reports, the counts of a copy, short reads only at the end, and a size that is kept.
#pragma once

#include <windows.h>
#include <objidl.h>

#include "tools/lvconsume/consumer_steps.h"
#include "tools/lvconsume/partial_file.h"

class StreamChecks {
public:
    // A position or count that the callee did not write.
    static constexpr ULONGLONG kUnset = ~0ULL;
    // CopyTo's count for "up to the end".
    static constexpr ULONGLONG kAllTheRest = ~0ULL;

    StreamChecks(IStream* source, PartialFile& file, FailureRecord& failure) noexcept
        : source_(source), file_(file), failure_(failure) {}

    // The size by seeking to the end, then back to the start.
    [[nodiscard]] bool Size(ULONGLONG& size);
    [[nodiscard]] bool AtStart(ULONGLONG position);
    [[nodiscard]] bool Stat(DWORD flags, ULONGLONG& size);
    // Seeks by 0 from origin; reached stays kUnset when the stream does not write it.
    [[nodiscard]] HRESULT SeekBy0(DWORD origin, ULONGLONG& reached) noexcept;
    // A seek that must succeed and write back the position it reached.
    [[nodiscard]] bool Seek(DWORD origin, const wchar_t* label, ULONGLONG& position);
    // One CopyTo into the file; read and written must both be what the stream still holds.
    [[nodiscard]] bool CopyTo(ULONGLONG wanted, ULONGLONG expected);
    // Reads 64 KiB pieces into the file; a read that returns fewer bytes than asked is the end.
    [[nodiscard]] bool ReadToEnd();
    // A stream that ended before the size it announced is a failure, never a file.
    [[nodiscard]] bool Complete(ULONGLONG size);

    [[nodiscard]] bool Fail(std::wstring what, HRESULT code) {
        return failure_.Fail(std::move(what), code);
    }
    ULONGLONG bytes() const noexcept { return bytes_; }

private:
    IStream* const source_;
    PartialFile& file_;
    FailureRecord& failure_;
    ULONGLONG bytes_ = 0;  // written into the file so far
};
