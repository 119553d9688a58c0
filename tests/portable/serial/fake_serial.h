// Test doubles of the driver's outside world: a scripted port on a fake clock, a memory file,
// a recording callback and the English texts.
#pragma once

#include <cstdint>
#include <deque>
#include <functional>
#include <string>
#include <vector>

#include "download/portable/driver_text.h"
#include "download/portable/parser_callback.h"
#include "download/portable/protocol_io.h"

using Bytes = std::vector<uint8_t>;

inline Bytes ToBytes(const std::string& text) {
    return Bytes(text.begin(), text.end());
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
// split); an empty port costs the port's total time-out on the fake clock, as a real one would.
class FakePort final : public SerialPort {
public:
    explicit FakePort(FakeClock& clock) : clock_(clock) {}

    // Bytes that arrive after the driver's next purge (answers to what it just wrote).
    void Deliver(const Bytes& chunk) { pending_.push_back(chunk); }
    void Deliver(const std::string& chunk) { Deliver(ToBytes(chunk)); }
    // Bytes already waiting in the receive queue (a purge drops them).
    void Queue(const Bytes& chunk) { incoming_.push_back(chunk); }

    size_t Read(uint8_t* buffer, size_t count) override {
        ++readCalls;
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
        const Bytes chunk(bytes, bytes + count);
        written.insert(written.end(), chunk.begin(), chunk.end());
        writes.push_back(chunk);
        if (onWrite)
            onWrite(chunk, *this);
        return count;
    }

    void Purge(bool, bool receive) override {
        ++purges;
        if (receive)
            incoming_.clear();
    }
    void Break() override { ++breaks; }
    void Close() override { ++closes; }

    std::function<void(const Bytes& written, FakePort& port)> onWrite;
    std::function<void(FakePort& port)> onSilence;
    bool refuseWrites = false;
    int refusedWrites = 0;
    Bytes written;
    std::vector<Bytes> writes;
    int readCalls = 0;
    int purges = 0;
    int breaks = 0;
    int closes = 0;

private:
    FakeClock& clock_;
    std::deque<Bytes> pending_;
    std::deque<Bytes> incoming_;
};

class MemoryFile final : public ReceiveFile {
public:
    bool Create() override {
        ++creates;
        content.clear();
        open = true;
        return true;
    }
    void Write(const uint8_t* bytes, size_t count) override {
        content.insert(content.end(), bytes, bytes + count);
    }
    uint64_t Position() override { return content.size(); }
    void Close() override { open = false; }

    std::string Text() const { return std::string(content.begin(), content.end()); }

    Bytes content;
    bool open = false;
    int creates = 0;
};

struct RecordedMessage {
    uint32_t code;
    WideString text;
    bool operator==(const RecordedMessage&) const = default;
};

// What a run that shows exactly one message must have recorded.
inline std::vector<RecordedMessage> OnlyMessage(uint32_t code, const WideString& text) {
    return {{code, text}};
}

class RecordingCallback final : public TParserCallBack {
public:
    void ShowMessage(uint32_t code, const WideChar* text) override {
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
        switch (text) {
            case DriverText::PortNotOpened:
                return WIDE_TEXT("Can not open COM port. Port is already open by another program");
            case DriverText::WaitExpired:
                return WIDE_TEXT("The waiting time of the data has expired.");
            case DriverText::InterruptedByUser:
                return WIDE_TEXT("The communication's process is interrupted by the user");
            case DriverText::BlockImportFailed:
                return WIDE_TEXT("AZ doesn't respond or error in importing block");
            case DriverText::InputFileBccMismatch:
                return WIDE_TEXT(
                    "Incorrect input file: BCC in block %d mismatch with computed %d!=%d");
            case DriverText::YModemFileInfo:
                return WIDE_TEXT("Y-Modem File Info: %s (size=%s)");
        }
        return {};
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
