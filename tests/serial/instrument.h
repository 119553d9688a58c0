// The instrument simulator on a thread of its own, playing a digital level at 7E1 on one end of
// a virtual cable, for the tests of the receiving end.
#pragma once

#include <windows.h>

#include <string>
#include <thread>
#include <vector>

#include "download/az_comm.h"
#include "tools/lvsim/instrument_simulator.h"

class Instrument {
public:
    // The instrument repeats an unanswered line every half second, maxResends times: long
    // enough for the receiver to start, short enough to give up soon after a cancel.
    Instrument(const wchar_t* port, uint32_t baudRate, uint32_t lineCount, uint32_t maxResends)
        : device_(port), lines_(GenerateSurveyLines(lineCount, 60)) {
        options_.BaudRate = baudRate;
        options_.AnswerTimeoutMs = 500;
        options_.MaxResends = maxResends;
    }
    ~Instrument() { (void)Finish(); }
    bool Open() {
        DCB dcb{};
        dcb.DCBlength = sizeof dcb;
        dcb.BaudRate = options_.BaudRate;
        dcb.ByteSize = kReceiveDataBits;
        dcb.Parity = EVENPARITY;
        dcb.StopBits = ONESTOPBIT;
        dcb.fBinary = TRUE;
        COMMTIMEOUTS timeouts{};
        timeouts.ReadIntervalTimeout = 20;
        timeouts.ReadTotalTimeoutConstant = 100;
        timeouts.WriteTotalTimeoutConstant = 1000;
        return port_.Open(device_.c_str(), dcb, timeouts) == ERROR_SUCCESS;
    }
    void Play() {
        thread_ = std::thread([this] {
            port_.Purge(true, true);
            result_ = InstrumentSimulator(port_, options_).SendLines(lines_);
            port_.Close();
        });
    }
    // Complete when the receiver acknowledged every line.
    TransferResult Finish() {
        if (thread_.joinable())
            thread_.join();
        return result_;
    }
    // The file the receiver must write: every line as it went over the wire.
    std::string ExpectedFile() const {
        std::string file = "A,01,Z\r\n";
        for (const std::string& line : lines_)
            file += WithCheckCharacter(line);
        return file + "Z,&,\r\n";
    }

private:
    std::wstring device_;
    std::vector<std::string> lines_;
    SimulatorOptions options_;
    Win32SerialPort port_;
    std::thread thread_;
    TransferResult result_ = TransferResult::Failed;
};
