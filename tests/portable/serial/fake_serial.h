// Test doubles of the driver's outside world: a scripted port on a fake clock, a memory file,
// a recording callback and the English texts; and the small builders the protocol tests share.
#pragma once

#include <algorithm>
#include <cstdint>
#include <deque>
#include <functional>
#include <ostream>
#include <string>
#include <vector>

#include "download/portable/serial_protocol.h"  // with the port, file, callback and text types

using Bytes = std::vector<uint8_t>;

// Failure messages name the values as the driver's callers see them.
inline void PrintTo(TransferResult result, std::ostream* stream) {
    *stream << (result == TransferResult::Complete ? "Complete" : "Failed");
}
inline void PrintTo(MessageCode code, std::ostream* stream) {
    *stream << "message code " << PostedCodeOf(code);
}

inline Bytes ToBytes(const std::string& text) {
    return Bytes(text.begin(), text.end());
}

inline const uint8_t* BytesOf(const std::string& text) {
    return reinterpret_cast<const uint8_t*>(text.data());
}

inline CrcTable MakeCrcTable() {
    CrcTable table;
    BuildCrcTable(table);
    return table;
}

// Time moves only when the port says so.
class FakeClock final : public ProtocolClock {
public:
    int64_t WallSeconds() override { return milliseconds / 1000; }
    uint32_t TickMilliseconds() override { return static_cast<uint32_t>(milliseconds); }
    void Advance(int64_t step) { milliseconds += step; }
    int64_t milliseconds = 1'000'000;
};

// A port whose peer is a script: what the driver writes is handed to onWrite, which answers
// with Deliver. Each Read returns at most one delivered chunk (so a test chooses where bursts
// split); an empty port costs the port's total time-out on the fake clock, as a real one would,
// and each write costs millisecondsPerWrite.
class FakePort final : public SerialPort {
public:
    explicit FakePort(FakeClock& clock) : clock_(clock) {}

    // Bytes that arrive after the driver's next purge (answers to what it just wrote).
    void Deliver(const Bytes& chunk) { pending_.push_back(chunk); }
    void Deliver(const std::string& chunk) { Deliver(ToBytes(chunk)); }
    // Bytes already waiting in the receive queue (a purge drops them).
    void Queue(const Bytes& chunk) { incoming_.push_back(chunk); }

    size_t Read(uint8_t* buffer, size_t count) override {
        for (auto& chunk : pending_)
            incoming_.push_back(std::move(chunk));
        pending_.clear();
        if (count == 0)
            return 0;
        if (incoming_.empty()) {
            clock_.Advance(100 + static_cast<int64_t>(count));
            if (onSilence)
                onSilence(*this);
            return 0;
        }
        Bytes& chunk = incoming_.front();
        const size_t taken = std::min(count, chunk.size());
        std::copy(chunk.begin(), chunk.begin() + taken, buffer);
        chunk.erase(chunk.begin(), chunk.begin() + taken);
        if (chunk.empty())
            incoming_.pop_front();
        clock_.Advance(1);
        return taken;
    }

    size_t Write(const uint8_t* bytes, size_t count) override {
        if (refuseWrites) {
            // A stalled line: the write time-out passes and no byte moves.
            ++refusedWrites;
            clock_.Advance(100);
            return 0;
        }
        clock_.Advance(millisecondsPerWrite);
        const Bytes chunk(bytes, bytes + count);
        writes.push_back(chunk);
        if (onWrite)
            onWrite(chunk, *this);
        return count;
    }

    void Purge(bool, bool receive) override {
        if (receive)
            incoming_.clear();
    }
    void Break() override { ++breaks; }
    void Close() override { ++closes; }

    long WritesOf(const Bytes& bytes) const {
        return std::count(writes.begin(), writes.end(), bytes);
    }

    std::function<void(const Bytes& written, FakePort& port)> onWrite;
    std::function<void(FakePort& port)> onSilence;
    bool refuseWrites = false;
    int refusedWrites = 0;
    int64_t millisecondsPerWrite = 0;
    std::vector<Bytes> writes;  // one entry per Write call
    int breaks = 0;
    int closes = 0;

private:
    FakeClock& clock_;
    std::deque<Bytes> pending_;
    std::deque<Bytes> incoming_;
};

// A file on a disk of `capacity` bytes: a write past it stores what fits and fails as a full
// disk does; closeError makes the close fail.
class MemoryFile final : public ReceiveFile {
public:
    static constexpr uint32_t kDiskFull = 112;  // the system's code for a full disk

    uint32_t Create() override {
        ++creates;
        content.clear();
        open = createError == kFileWritten;
        return createError;
    }
    uint32_t Write(const uint8_t* bytes, size_t count) override {
        ++writeCalls;
        const size_t room = capacity > content.size() ? capacity - content.size() : 0;
        content.insert(content.end(), bytes, bytes + std::min(room, count));
        return count <= room ? kFileWritten : kDiskFull;
    }
    uint64_t Position() override { return content.size(); }
    uint32_t Close() override {
        open = false;
        return closeError;
    }

    std::string Text() const { return std::string(content.begin(), content.end()); }

    Bytes content;
    bool open = false;
    int creates = 0;
    int writeCalls = 0;
    size_t capacity = SIZE_MAX;
    uint32_t closeError = kFileWritten;
    uint32_t createError = kFileWritten;
};

struct RecordedMessage {
    MessageCode code;
    WideString text;
    bool operator==(const RecordedMessage&) const = default;
};

// What a run that shows exactly one message must have recorded.
inline std::vector<RecordedMessage> OnlyMessage(MessageCode code, const WideString& text) {
    return {{code, text}};
}

class RecordingCallback final : public TParserCallBack {
public:
    void ShowMessage(MessageCode code, const WideChar* text) override {
        messages.push_back({code, text});
    }
    void SetProgress(uint32_t total, uint32_t current) override {
        progress.push_back({total, current});
    }
    bool IsCancelled() override { return cancelWhen ? cancelWhen() : false; }

    std::vector<RecordedMessage> messages;
    std::vector<std::pair<uint32_t, uint32_t>> progress;
    std::function<bool()> cancelWhen;
};

class EnglishTexts final : public DriverTextSource {
public:
    WideString Text(DriverText text) const override {
        static const WideChar* const kTexts[] = {
            // in the order of DriverText
            WIDE_TEXT("Can not open COM port. Port is already open by another program"),
            WIDE_TEXT("The waiting time of the data has expired."),
            WIDE_TEXT("The communication's process is interrupted by the user"),
            WIDE_TEXT("AZ doesn't respond or error in importing block"),
            WIDE_TEXT("Incorrect input file: BCC in block %d mismatch with computed %d!=%d"),
            WIDE_TEXT("The instrument sent more than %d MiB, more than any instrument holds. "
                      "The transfer was stopped."),
            WIDE_TEXT("Y-Modem File Info: %s (size=%s)"),
        };
        return kTexts[static_cast<size_t>(text)];
    }
    WideString SystemErrorText(uint32_t code) const override {
        return WIDE_TEXT("System error ") + DecimalText(code);
    }
};

// The pieces of one driver run, wired together.
struct ProtocolRig {
    FakeClock clock;
    FakePort port{clock};
    MemoryFile file;
    RecordingCallback callback;
    EnglishTexts texts;
};

// A driver of the given procedure over its own rig, its port open as its owner leaves it.
struct ProtocolRun : ProtocolRig {
    explicit ProtocolRun(ReceiveProcedure procedure)
        : protocol(port, clock, file, callback, texts, procedure) {
        protocol.SetPortOpen(true);
    }
    SerialProtocol protocol;
};
