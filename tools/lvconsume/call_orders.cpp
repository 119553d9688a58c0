// The orders of stream calls, each a sequence of checked calls.
#include "tools/lvconsume/call_orders.h"

#include <cwchar>
#include <string>

namespace {

const NamedOrder kOrders[] = {
    {L"stat-seek-read", Order::kStatSeekRead}, {L"seek-copyto", Order::kSeekCopyTo},
    {L"read-only", Order::kReadOnly},          {L"copyto-halves", Order::kCopyToHalves},
    {L"stat-after", Order::kStatAfter},
};

bool RunStatSeekRead(StreamChecks& stream) {
    ULONGLONG named = 0, unnamed = 0, end = 0, start = 0;
    if (!stream.Stat(STATFLAG_DEFAULT, named) || !stream.Stat(STATFLAG_NONAME, unnamed))
        return false;
    if (named != unnamed) {
        return stream.Fail(L"Stat gives " + std::to_wstring(named) + L" bytes with its name and " +
                               std::to_wstring(unnamed) + L" without",
                           E_FAIL);
    }
    if (!stream.Seek(STREAM_SEEK_END, L"STREAM_SEEK_END", end))
        return false;
    if (end != named) {
        return stream.Fail(L"Seek to the end reports " + std::to_wstring(end) + L" bytes; Stat " +
                               std::to_wstring(named),
                           E_FAIL);
    }
    if (!stream.Seek(STREAM_SEEK_SET, L"STREAM_SEEK_SET", start) || !stream.AtStart(start))
        return false;
    return stream.ReadToEnd() && stream.Complete(named);
}

bool RunSeekCopyTo(StreamChecks& stream) {
    ULONGLONG size = 0;
    return stream.Size(size) && stream.CopyTo(size, size) && stream.Complete(size);
}

bool RunCopyToHalves(StreamChecks& stream) {
    ULONGLONG size = 0;
    return stream.Size(size) && stream.CopyTo(size / 2, size / 2) &&
           stream.CopyTo(StreamChecks::kAllTheRest, size - size / 2) && stream.Complete(size);
}

bool RunStatAfter(StreamChecks& stream) {
    ULONGLONG size = 0, position = StreamChecks::kUnset;
    if (!stream.ReadToEnd() || !stream.Stat(STATFLAG_NONAME, size) || !stream.Complete(size))
        return false;
    // After the last byte the stream's temporary file is gone: there is nothing to go back to.
    const HRESULT result = stream.SeekBy0(STREAM_SEEK_SET, position);
    if (result != STG_E_INVALIDFUNCTION) {
        return stream.Fail(L"Seek(0, STREAM_SEEK_SET) after the end answered " + Hex(result) +
                               L", not STG_E_INVALIDFUNCTION",
                           FAILED(result) ? result : E_FAIL);
    }
    Step(L"Seek(0, STREAM_SEEK_SET) after the end: STG_E_INVALIDFUNCTION");
    return true;
}

}  // namespace

const NamedOrder* FindOrder(const wchar_t* name) noexcept {
    for (const NamedOrder& known : kOrders) {
        if (std::wcscmp(name, known.name) == 0)
            return &known;
    }
    return nullptr;
}

bool RunOrder(Order order, StreamChecks& stream) {
    switch (order) {
        case Order::kStatSeekRead:
            return RunStatSeekRead(stream);
        case Order::kSeekCopyTo:
            return RunSeekCopyTo(stream);
        case Order::kReadOnly:
            return stream.ReadToEnd();
        case Order::kCopyToHalves:
            return RunCopyToHalves(stream);
        case Order::kStatAfter:
            return RunStatAfter(stream);
    }
    return stream.Fail(L"unknown order", E_INVALIDARG);
}
