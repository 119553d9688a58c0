// InstrumentSimulator: plays a digital level's side of the protocols on an open port.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "download/portable/protocol_vocabulary.h"
#include "download/win32_serial_port.h"

struct SimulatorOptions {
    uint32_t BaudRate = 9600;
    uint32_t BitsPerCharacter = 10;   // start + 7 data + parity + stop for 7E1
    uint32_t AnswerTimeoutMs = 1000;  // no ACK or NAK within this: send the line again
    uint32_t MaxResends = 20;         // of one line or block before giving up
    // Faults (line numbers count data lines from 1; 0 = off).
    uint32_t BadCheckLine = 0;         // first sending of that line carries a wrong check character
    uint32_t LostAckLine = 0;          // the ACK of that line is ignored once: the line is resent
    uint32_t NoiseLines = 0;           // noise lines before the header
    uint32_t SilenceSeconds = 0;       // hold the port and say nothing for so long first
    bool LongLineWithoutEnd = false;   // a 128-byte line without CR LF after the header
    uint32_t DisconnectAfterLine = 0;  // close the port after that line or block was acknowledged
                                       // (raw stream: was sent), and say nothing more
    uint32_t LineGapMs = 0;            // raw stream: pause after each line, so that each line
                                       // reaches the receiver as a burst of its own
    uint32_t TurnaroundMs = 10;        // the instrument's pause between an answer and its next
                                       // line or block
    bool WholeWrites = false;          // hand each line to the port at once and then wait its
                                       // wire time, instead of byte by byte as a cable does
    bool Endless = false;              // BCC blocks and Y-Modem: the data over and over, never
                                       // the end, as long as the receiver acknowledges
    bool Verbose = false;
};

class InstrumentSimulator {
public:
    InstrumentSimulator(Win32SerialPort& port, const SimulatorOptions& options)
        : port_(port), options_(options) {}

    // Header "A,01,Z", the data lines (without CR LF; check characters are computed), "Z,&,".
    // Complete when the receiver acknowledged everything.
    [[nodiscard]] TransferResult SendLines(const std::vector<std::string>& dataLines);
    // The lines as an instrument prints them (each with its CR LF), then EOT; no answer is
    // awaited. Complete when everything was sent.
    [[nodiscard]] TransferResult SendRawStream(const std::vector<std::string>& printedLines);
    // One BCC block per line, started by the receiver's ENQ, ended by EOT.
    [[nodiscard]] TransferResult SendBccBlocks(const std::vector<std::string>& dataLines);
    // Y-Modem: header block with name and size, 128-byte CRC blocks, EOT.
    [[nodiscard]] TransferResult SendYModem(const std::string& name, const std::string& content);

    uint64_t BytesSent() const { return bytesSent_; }
    uint64_t BytesReceived() const { return bytesReceived_; }

private:
    // Writes at the wire speed of the configured baud rate and framing: each byte leaves when
    // the one before it would have left the wire (or, with WholeWrites, all at once and the
    // call then waits out the wire time).
    [[nodiscard]] bool SendPaced(const std::string& bytes);
    [[nodiscard]] bool WriteAll(const char* bytes, size_t count) noexcept;
    void Turnaround();
    // Reads until a CR LF ends an answer, or the answer time-out passes; empty when none.
    std::string ReadAnswer(uint32_t timeoutMs);
    [[nodiscard]] bool SendLineUntilAcknowledged(const std::string& line, bool corruptFirst,
                                                 bool loseFirstAck);

    Win32SerialPort& port_;
    SimulatorOptions options_;
    uint64_t bytesSent_ = 0;
    uint64_t bytesReceived_ = 0;
};

// "body" + check character + "," + CR LF: a data line as the instrument sends it.
std::string WithCheckCharacter(const std::string& body);
// N plausible levelling lines of about the given length (without CR LF).
std::vector<std::string> GenerateSurveyLines(uint32_t count, uint32_t length);
