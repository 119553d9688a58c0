// The external communication library "HalvekComm.dll": the slot layout of the object that its
// "CreateInstance" returns, and the adapter that loads it and talks to the object.
#pragma once

#include <windows.h>

#include <cstdint>
#include <memory>
#include <string>

#include "support/portable/wide_text.h"

// Called by the library, on a thread of its own, once the transfer has ended.
using HalvekCompletionFunction = void (*)(int32_t result);

// The library object's virtual operations, slot by slot from 0. Slots this system never calls
// are kept as placeholders so that the ones it calls sit where the library has them. The
// library's destructor occupies one slot taking a flag (1 = delete the object); it is declared
// as a plain operation so that every compiler lays it out as that one slot.
class IHalvekCommObject {
public:
    virtual void DeleteObject(uint32_t flags) = 0;  // 0
    virtual void Reserved1() = 0;                   // 1
    virtual int32_t SetCommParams(int32_t port, int32_t baudRate, int32_t parity, int32_t stopBits,
                                  int32_t flow, int32_t dataBits, int32_t checkSum) = 0;  // 2
    virtual int32_t Initialize() = 0;                                                     // 3
    virtual int32_t StartDownload(int32_t first, int32_t second) = 0;                     // 4
    virtual void Reserved5() = 0;                                                         // 5
    virtual int32_t SetPoints(void* points) = 0;                                          // 6
    virtual void Reserved7() = 0;                                                         // 7
    virtual int32_t Cancel() = 0;                                                         // 8
    virtual int32_t SetFilePath(const char* path) = 0;                                    // 9
    virtual int32_t SetTimeout(int32_t timeout) = 0;                                      // 10
    virtual void Reserved11() = 0;                                                        // 11
    virtual void Reserved12() = 0;                                                        // 12
    virtual void SetCallback(HalvekCompletionFunction callback) = 0;                      // 13

protected:
    ~IHalvekCommObject() = default;  // only DeleteObject ends the object's life
};

using HalvekCreateInstanceFunction = IHalvekCommObject* (*)();

// Deletes a library object through its destructor slot.
struct HalvekObjectDeleter {
    void operator()(IHalvekCommObject* object) const noexcept {
        if (object)
            object->DeleteObject(1);
    }
};
using UniqueHalvekObject = std::unique_ptr<IHalvekCommObject, HalvekObjectDeleter>;

// The library's result codes.
constexpr int32_t kHalvekNoError = 0;
constexpr int32_t kHalvekTimeout = -101;
constexpr int32_t kHalvekCancelled = -102;

// The points buffer: 5000 records of 144 bytes, each two 72-byte halves.
constexpr size_t kHalvekPointRecords = 5000;
constexpr size_t kHalvekPointRecordSize = 144;
constexpr size_t kHalvekPointHalfSize = 72;
constexpr size_t kHalvekPointMarkerOffset = 20;  // 32-bit value set to -1 in each half
constexpr size_t kHalvekPointsBufferSize = kHalvekPointRecords * kHalvekPointRecordSize;

// Loads the library from this module's directory (it stays loaded for the process) and creates
// one object. On failure object stays null and errorText holds the system's text for the error.
[[nodiscard]] HRESULT CreateHalvekObject(UniqueHalvekObject& object,
                                         std::wstring& errorText) noexcept;
// The same with the library at libraryPath (a full path); its dependencies are looked for in its
// own folder and the system's, never in the current directory or PATH.
[[nodiscard]] HRESULT CreateHalvekObjectFrom(const std::wstring& libraryPath,
                                             UniqueHalvekObject& object,
                                             std::wstring& errorText) noexcept;

// A new points buffer with every half's marker set to -1; null when memory is short.
std::unique_ptr<uint8_t[]> MakeHalvekPointsBuffer();

// The decimal number that starts at the first digit of the port name ("COM3" gives 3; a name
// without digits gives 0; a number too large for 32 bits stops growing at its last digit that
// fits).
int32_t HalvekPortNumber(WideStringView port) noexcept;

// The output path as the library takes it: 8-bit text in this thread's code page, at most 260
// bytes with the terminator.
std::string HalvekFilePath(const std::wstring& path);

// Whether the file the library reported as received can be handed on: S_OK when it exists, no
// one still writes it, it holds data and its drive did not run out of room (the library's own
// success says nothing about a write that the disk cut short); otherwise the HRESULT of what is
// wrong.
[[nodiscard]] HRESULT CheckReceivedFile(const std::wstring& path) noexcept;

// The string-table text for a library result code.
std::wstring HalvekResultText(int32_t code);
