// The substitute communication library: the object of "CreateInstance" with the real library's
// slots, a transfer on its own thread that writes "<path>.txt", and behaviour chosen by
// environment variables (read when each operation is called):
//   HALVEKCOMM_RESULT=<code>        result reported through the callback (default 0: a file)
//   HALVEKCOMM_START_RESULT=<code>  result of StartDownload itself (nonzero: nothing starts)
//   HALVEKCOMM_FAIL=<operation>     SetFilePath, SetTimeout, SetPoints or SetCommParams fails
//   HALVEKCOMM_DELAY_MS=<ms>        length of the transfer (default 300)
//   HALVEKCOMM_IGNORE_CANCEL=1      Cancel is not honoured (otherwise it ends with -102)
//   HALVEKCOMM_CANCEL_DELAY_MS=<ms> time a honoured Cancel takes to wind down (default 0)
//   HALVEKCOMM_LOG=<path>           every call is appended to this file, one line each
// Built with HALVEKCOMM_WITH_DEPENDENCY it imports lv_halvek_dependency.dll and logs its answer
// on CreateInstance, as a library that needs a library of its own beside it.
#include <windows.h>

#include <atomic>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <string>

#include "download/halvek_comm.h"
#include "support/unique_resource.h"

namespace {

std::string Environment(const char* name) {
    char value[512] = {};
    const DWORD length = ::GetEnvironmentVariableA(name, value, sizeof value);
    return length > 0 && length < sizeof value ? std::string(value, length) : std::string();
}

int32_t EnvironmentNumber(const char* name, int32_t fallback) {
    const std::string value = Environment(name);
    return value.empty() ? fallback : static_cast<int32_t>(std::strtol(value.c_str(), nullptr, 10));
}

void Log(const std::string& line) {
    const std::string path = Environment("HALVEKCOMM_LOG");
    if (path.empty())
        return;
    if (FILE* file = std::fopen(path.c_str(), "ab")) {
        std::fprintf(file, "%s\r\n", line.c_str());
        std::fclose(file);
    }
}

int32_t FailsIfAsked(const char* operation) {
    return Environment("HALVEKCOMM_FAIL") == operation ? 1 : 0;
}

// A job as an instrument of this kind hands it over: a header, a levelling line with backsight
// and foresight readings, and the closing line.
bool WriteReceivedFile(const std::string& path, int32_t port, int32_t baudRate) {
    FILE* file = std::fopen(path.c_str(), "wb");
    if (!file)
        return false;
    std::fprintf(file, "HVR2X,JOB,LINE_A,PORT%d,%d\r\n", port, baudRate);
    std::fprintf(file, "UNITS,M,METRES\r\n");
    double height = 102.4531;
    for (int point = 1; point <= 12; ++point) {
        const double backsight = 1.2 + (point % 5) * 0.1371;
        const double foresight = 1.1 + (point % 7) * 0.0913;
        std::fprintf(file, "PT,%04d,BS,%.4f,DIST,%.2f\r\n", 1000 + point, backsight,
                     18.5 + point * 0.75);
        height += backsight - foresight;
        std::fprintf(file, "PT,%04d,FS,%.4f,H,%.4f\r\n", 1001 + point, foresight, height);
    }
    std::fprintf(file, "END,POINTS,24\r\n");
    return std::fclose(file) == 0;
}

class SubstituteObject final : public IHalvekCommObject {
public:
    void DeleteObject(uint32_t flags) override {
        Log("DeleteObject " + std::to_string(flags));
        if (worker_) {
            cancelled_ = true;  // a transfer still running is abandoned, never reported
            callback_ = nullptr;
            ::WaitForSingleObject(worker_.get(), INFINITE);
            worker_.reset();
        }
        if (flags & 1)
            delete this;
    }
    void Reserved1() override {}
    int32_t SetCommParams(int32_t port, int32_t baudRate, int32_t parity, int32_t stopBits,
                          int32_t flow, int32_t dataBits, int32_t checkSum) override {
        Log("SetCommParams port=" + std::to_string(port) + " baud=" + std::to_string(baudRate) +
            " parity=" + std::to_string(parity) + " stop=" + std::to_string(stopBits) +
            " flow=" + std::to_string(flow) + " data=" + std::to_string(dataBits) +
            " checksum=" + std::to_string(checkSum));
        port_ = port;
        baudRate_ = baudRate;
        return FailsIfAsked("SetCommParams");
    }
    int32_t Initialize() override {
        Log("Initialize");
        return 0;
    }
    int32_t StartDownload(int32_t first, int32_t second) override {
        Log("StartDownload " + std::to_string(first) + " " + std::to_string(second));
        const int32_t startResult = EnvironmentNumber("HALVEKCOMM_START_RESULT", 0);
        if (startResult != 0)
            return startResult;
        if (worker_)
            return -301;  // one transfer per object
        result_ = EnvironmentNumber("HALVEKCOMM_RESULT", 0);
        delayMilliseconds_ = EnvironmentNumber("HALVEKCOMM_DELAY_MS", 300);
        honourCancel_ = Environment("HALVEKCOMM_IGNORE_CANCEL") != "1";
        cancelDelayMilliseconds_ = EnvironmentNumber("HALVEKCOMM_CANCEL_DELAY_MS", 0);
        worker_.reset(::CreateThread(nullptr, 0, &SubstituteObject::Transfer, this, 0, nullptr));
        return worker_ ? 0 : -301;
    }
    void Reserved5() override {}
    int32_t SetPoints(void* points) override {
        // Counts the halves whose marker the caller set, as the real library expects them.
        int markers = 0;
        for (size_t half = 0; points && half < kHalvekPointsBufferSize / kHalvekPointHalfSize;
             ++half) {
            int32_t marker = 0;
            std::memcpy(&marker,
                        static_cast<const uint8_t*>(points) + half * kHalvekPointHalfSize +
                            kHalvekPointMarkerOffset,
                        sizeof marker);
            markers += marker == -1;
        }
        Log("SetPoints markers=" + std::to_string(markers));
        return FailsIfAsked("SetPoints");
    }
    void Reserved7() override {}
    int32_t Cancel() override {
        Log("Cancel");
        if (honourCancel_)
            cancelled_ = true;
        return 0;
    }
    int32_t SetFilePath(const char* path) override {
        path_ = path ? path : "";
        Log("SetFilePath " + path_);
        return FailsIfAsked("SetFilePath");
    }
    int32_t SetTimeout(int32_t timeout) override {
        Log("SetTimeout " + std::to_string(timeout));
        return FailsIfAsked("SetTimeout");
    }
    void Reserved11() override {}
    void Reserved12() override {}
    void SetCallback(HalvekCompletionFunction callback) override {
        Log("SetCallback");
        callback_ = callback;
    }

private:
    static DWORD WINAPI Transfer(void* parameter) {
        auto* self = static_cast<SubstituteObject*>(parameter);
        int32_t result = self->result_;
        for (int32_t waited = 0; waited < self->delayMilliseconds_; waited += 10) {
            if (self->cancelled_) {
                result = kHalvekCancelled;
                ::Sleep(self->cancelDelayMilliseconds_);
                break;
            }
            ::Sleep(10);
        }
        if (result == kHalvekNoError &&
            !WriteReceivedFile(self->path_ + ".txt", self->port_, self->baudRate_)) {
            result = -201;
        }
        Log("Completed " + std::to_string(result));
        if (HalvekCompletionFunction callback = self->callback_.load())
            callback(result);
        return 0;
    }

    std::string path_;
    int32_t port_ = 0;
    int32_t baudRate_ = 0;
    int32_t result_ = 0;
    int32_t delayMilliseconds_ = 300;
    int32_t cancelDelayMilliseconds_ = 0;
    bool honourCancel_ = true;
    std::atomic<bool> cancelled_{false};
    std::atomic<HalvekCompletionFunction> callback_{nullptr};
    UniqueHandle worker_;
};

}  // namespace

#ifdef HALVEKCOMM_WITH_DEPENDENCY
extern "C" __declspec(dllimport) int32_t HalvekDependencyAnswer();
#endif

extern "C" __declspec(dllexport) IHalvekCommObject* CreateInstance() {
    Log("CreateInstance");
#ifdef HALVEKCOMM_WITH_DEPENDENCY
    Log("Dependency answer=" + std::to_string(HalvekDependencyAnswer()));
#endif
    return new (std::nothrow) SubstituteObject;
}
