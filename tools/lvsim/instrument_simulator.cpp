// InstrumentSimulator: the instrument's side of the line, BCC and Y-Modem protocols.
#include "tools/lvsim/instrument_simulator.h"

#include <algorithm>
#include <cstdio>
#include <ctime>

#include "download/portable/block_format.h"

using namespace serial_bytes;

namespace {
bool IsAck(const std::string& answer) {
    return !answer.empty() && static_cast<uint8_t>(answer.front()) == kAck;
}

// How a verbose log names the receiver's answer.
const char* AnswerName(const std::string& answer) {
    if (answer.empty())
        return "none";
    return IsAck(answer) ? "ACK" : "NAK";
}
}  // namespace

std::string WithCheckCharacter(const std::string& body) {
    const char check = static_cast<char>(
        LineCheckCharacter(reinterpret_cast<const uint8_t*>(body.data()), body.size()));
    return body + check + ",\r\n";
}

std::vector<std::string> GenerateSurveyLines(uint32_t count, uint32_t length) {
    std::vector<std::string> lines;
    double height = 100.0;
    for (uint32_t i = 1; i <= count; ++i) {
        char line[256];
        const double reading = 1.0 + (i * 37 % 2000) / 1000.0;
        height += (i % 2 ? 1 : -1) * reading / 10.0;
        int n = std::snprintf(line, sizeof line, "%s,%04u,%07.5f,%08.3f,%06.2f,",
                              i % 2 ? "RB" : "RF", i, reading, height, 20.0 + i % 30);
        std::string text(line, n);
        // Pad with a point-code field so that the whole line (with check, comma and CR LF)
        // has the asked length.
        if (length > text.size() + 3 + 2)
            text += std::string(length - text.size() - 3 - 2, 'P') + ",";
        lines.push_back(text);
    }
    return lines;
}

void InstrumentSimulator::Turnaround() {
    // The instrument takes its own time before it sends again, whatever the answer. What the
    // receiver says meanwhile (a NAK for the silence of a long pause) answers nothing the
    // instrument is about to send, and would be taken for the answer to the next block.
    if (options_.TurnaroundMs) {
        ::Sleep(options_.TurnaroundMs);
        port_.Purge(false, true);
    }
}

bool InstrumentSimulator::WriteAll(const char* bytes, size_t count) noexcept {
    size_t sent = 0;
    while (sent < count) {
        const size_t moved =
            port_.Write(reinterpret_cast<const uint8_t*>(bytes) + sent, count - sent);
        if (moved == 0)
            return false;
        sent += moved;
    }
    return true;
}

bool InstrumentSimulator::SendPaced(const std::string& bytes) {
    LARGE_INTEGER frequency, start, now;
    ::QueryPerformanceFrequency(&frequency);
    ::QueryPerformanceCounter(&start);
    const double characterSeconds =
        static_cast<double>(options_.BitsPerCharacter) / options_.BaudRate;
    const auto elapsed = [&] {
        ::QueryPerformanceCounter(&now);
        return static_cast<double>(now.QuadPart - start.QuadPart) / frequency.QuadPart;
    };
    if (options_.WholeWrites && !WriteAll(bytes.data(), bytes.size()))
        return false;
    size_t sent = options_.WholeWrites ? bytes.size() : 0;
    while (sent < bytes.size()) {
        // The bytes whose start bit is due by now go out together: at high rates several fall
        // within one wake-up of the thread, as they would arrive in one read from a cable.
        const size_t due =
            std::min(bytes.size(), static_cast<size_t>(elapsed() / characterSeconds) + 1);
        if (due > sent) {
            if (!WriteAll(bytes.data() + sent, due - sent))
                return false;
            sent = due;
        } else {
            ::Sleep(1);
        }
    }
    bytesSent_ += bytes.size();
    // A real line takes its time: wait until the last bit would have left the wire.
    const double wireSeconds = static_cast<double>(bytes.size()) * characterSeconds;
    for (double spent = elapsed(); spent < wireSeconds; spent = elapsed())
        ::Sleep(static_cast<DWORD>((wireSeconds - spent) * 1000) + 1);
    return true;
}

std::string InstrumentSimulator::ReadAnswer(uint32_t timeoutMs) {
    std::string answer;
    const ULONGLONG start = ::GetTickCount64();
    while (::GetTickCount64() - start < timeoutMs) {
        uint8_t buffer[64];
        const size_t got = port_.Read(buffer, sizeof buffer);
        answer.append(reinterpret_cast<const char*>(buffer), got);
        bytesReceived_ += got;
        if (answer.find("\r\n") != std::string::npos || answer.find('C') != std::string::npos ||
            (!answer.empty() && got == 0))
            return answer;
    }
    return answer;
}

bool InstrumentSimulator::SendLineUntilAcknowledged(const std::string& line, bool corruptFirst,
                                                    bool loseFirstAck) {
    for (uint32_t attempt = 0; attempt <= options_.MaxResends; ++attempt) {
        std::string sent = line;
        if (corruptFirst && attempt == 0 && sent.size() >= 4)
            sent[sent.size() - 4] ^= 0x01;
        if (!SendPaced(sent))
            return false;
        const std::string answer = ReadAnswer(options_.AnswerTimeoutMs);
        if (options_.Verbose)
            std::fprintf(stderr, "lvsim: sent %zu bytes, answer %s\n", sent.size(),
                         AnswerName(answer));
        Turnaround();
        if (IsAck(answer)) {
            if (loseFirstAck && attempt == 0)
                continue;  // as if the ACK was lost on the line: the same line goes again
            return true;
        }
    }
    return false;
}

TransferResult InstrumentSimulator::SendLines(const std::vector<std::string>& dataLines) {
    if (options_.SilenceSeconds > 0)
        ::Sleep(options_.SilenceSeconds * 1000);
    for (uint32_t i = 0; i < options_.NoiseLines; ++i) {
        if (!SendPaced("?? noise " + std::to_string(i) + "\r\n"))
            return TransferResult::Failed;
        // Each is refused with a NAK line; nothing depends on it here.
        const std::string answer = ReadAnswer(options_.AnswerTimeoutMs);
        if (options_.Verbose)
            std::fprintf(stderr, "lvsim: sent noise line %u, answer %s\n", i + 1,
                         AnswerName(answer));
    }
    if (!SendLineUntilAcknowledged("A,01,Z\r\n", false, false))
        return TransferResult::Failed;
    if (options_.LongLineWithoutEnd) {
        // Never acknowledged: the receiver waits for CR LF until its time-out.
        (void)SendPaced(std::string(kLineCapacity, 'L'));
        (void)ReadAnswer(options_.AnswerTimeoutMs);
        return TransferResult::Failed;
    }
    for (uint32_t i = 1; i <= dataLines.size(); ++i) {
        if (!SendLineUntilAcknowledged(WithCheckCharacter(dataLines[i - 1]),
                                       i == options_.BadCheckLine, i == options_.LostAckLine))
            return TransferResult::Failed;
        if (i == options_.DisconnectAfterLine) {
            port_.Close();
            return TransferResult::Failed;
        }
    }
    return SendLineUntilAcknowledged("Z,&,\r\n", false, false) ? TransferResult::Complete
                                                               : TransferResult::Failed;
}

TransferResult InstrumentSimulator::SendRawStream(const std::vector<std::string>& printedLines) {
    for (uint32_t i = 1; i <= printedLines.size(); ++i) {
        if (!SendPaced(printedLines[i - 1]))
            return TransferResult::Failed;
        if (options_.Verbose)
            std::fprintf(stderr, "lvsim: sent line %u (%zu bytes)\n", i,
                         printedLines[i - 1].size());
        if (i == options_.DisconnectAfterLine) {
            port_.Close();
            return TransferResult::Failed;
        }
        if (options_.LineGapMs)
            ::Sleep(options_.LineGapMs);
    }
    return SendPaced(std::string(1, static_cast<char>(kEot))) ? TransferResult::Complete
                                                              : TransferResult::Failed;
}

TransferResult InstrumentSimulator::SendBccBlocks(const std::vector<std::string>& dataLines) {
    // Wait for the receiver's ENQ.
    const ULONGLONG start = ::GetTickCount64();
    for (;;) {
        const std::string poll = ReadAnswer(1000);
        if (!poll.empty() && static_cast<uint8_t>(poll.front()) == kEnq)
            break;
        if (::GetTickCount64() - start > 60000)
            return TransferResult::Failed;
    }
    uint32_t resends = 0;
    // Endless: block i carries line i % count, numbered on; the EOT never comes.
    const size_t last = options_.Endless && !dataLines.empty() ? SIZE_MAX : dataLines.size();
    for (size_t i = 0; i <= last;) {
        std::string block;
        if (i == last) {
            block = std::string(1, static_cast<char>(kEot));
        } else {
            const std::string& line = dataLines[i % dataLines.size()];
            const BccBlock bcc = BuildBccBlock(reinterpret_cast<const uint8_t*>(line.data()),
                                               line.size(), static_cast<uint32_t>(i));
            block.assign(bcc.begin(), bcc.end());
            if (i + 1 == options_.BadCheckLine)
                block[5] ^= 0x01;
        }
        if (!SendPaced(block))
            return TransferResult::Failed;
        const std::string answer = ReadAnswer(options_.AnswerTimeoutMs);
        if (i == last)
            return IsAck(answer) ? TransferResult::Complete : TransferResult::Failed;
        if (options_.Verbose)
            std::fprintf(stderr, "lvsim: sent block %zu, answer %s\n", i + 1, AnswerName(answer));
        Turnaround();
        if (IsAck(answer)) {
            ++i;
            resends = 0;
            if (i == options_.DisconnectAfterLine) {
                port_.Close();
                return TransferResult::Failed;
            }
            continue;
        }
        if (++resends > options_.MaxResends)
            return TransferResult::Failed;
        if (i + 1 == options_.BadCheckLine)
            options_.BadCheckLine = 0;  // the resend is clean
    }
    return TransferResult::Complete;
}

TransferResult InstrumentSimulator::SendYModem(const std::string& name,
                                               const std::string& content) {
    CrcTable table;
    BuildCrcTable(table);
    auto waitFor = [&](uint8_t wanted) {
        const ULONGLONG start = ::GetTickCount64();
        while (::GetTickCount64() - start < 60000) {
            const std::string answer = ReadAnswer(1000);
            if (answer.find(static_cast<char>(wanted)) != std::string::npos)
                return true;
        }
        return false;
    };
    if (!waitFor(kCrcRequest))
        return TransferResult::Failed;
    const YModemBlock header =
        BuildYModemHeaderBlock(name, static_cast<uint32_t>(content.size()),
                               static_cast<uint32_t>(_time64(nullptr)), table);
    if (!SendPaced(std::string(header.begin(), header.end())) || !waitFor(kAck))
        return TransferResult::Failed;
    // Endless: past the announced size the file's blocks come again; the EOT never comes.
    constexpr char kFiller = 0x1A;  // the last block's unused bytes, as Y-Modem senders fill them
    const size_t fileBlocks = (content.size() + kBlockDataSize - 1) / kBlockDataSize;
    const size_t blocks = options_.Endless && fileBlocks > 0 ? SIZE_MAX : fileBlocks;
    uint32_t resends = 0;
    for (size_t i = 0; i < blocks;) {
        std::string data = content.substr(i % fileBlocks * kBlockDataSize, kBlockDataSize);
        data.resize(kBlockDataSize, kFiller);
        const uint8_t number = static_cast<uint8_t>(i + 1);  // the header was block 0
        std::string block = {static_cast<char>(kSoh), static_cast<char>(number),
                             static_cast<char>(0xFF - number)};
        block += data;
        const uint16_t crc =
            Crc16(table, reinterpret_cast<const uint8_t*>(data.data()), kBlockDataSize);
        block += static_cast<char>(crc >> 8);
        block += static_cast<char>(crc);
        if (i + 1 == options_.BadCheckLine) {
            block[10] ^= 0x01;
            options_.BadCheckLine = 0;
        }
        if (!SendPaced(block))
            return TransferResult::Failed;
        const std::string answer = ReadAnswer(options_.AnswerTimeoutMs);
        if (options_.Verbose)
            std::fprintf(stderr, "lvsim: sent block %zu, answer %s\n", i + 1, AnswerName(answer));
        Turnaround();
        if (IsAck(answer)) {
            ++i;
            resends = 0;
            if (i == options_.DisconnectAfterLine) {
                port_.Close();
                return TransferResult::Failed;
            }
        } else if (++resends > options_.MaxResends) {
            return TransferResult::Failed;
        }
    }
    if (!SendPaced(std::string(1, static_cast<char>(kEot))))
        return TransferResult::Failed;
    return waitFor(kAck) ? TransferResult::Complete : TransferResult::Failed;
}
