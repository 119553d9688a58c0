// Arbitrary byte streams, in arbitrary bursts, fed to each receive procedure of the driver.
#include <cstddef>
#include <cstdint>
#include <optional>

#include "download/portable/serial_protocol.h"
#include "tests/portable/serial/fake_serial.h"

namespace {
// The first byte picks the procedure: the line protocol, or Receive with the stored selector
// that is one less (so the seed corpus keeps its meaning).
constexpr uint8_t kLineProtocol = 0;
constexpr uint8_t kProcedureChoices = 5;
constexpr size_t kProcedureByte = 0;
constexpr size_t kSeedByte = 1;
constexpr size_t kStreamStart = 2;
constexpr int kKeepInput = 0;  // libFuzzer's answer for an input worth keeping
}  // namespace

// Input: [procedure] [burst seed] stream... Each answer the driver writes, and each silence,
// lets the next burst arrive.
extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    if (size < kStreamStart)
        return kKeepInput;
    const uint8_t choice = data[kProcedureByte] % kProcedureChoices;
    // The line protocol runs with the download thread's procedure; every other choice is a
    // stored selector, all of which name a procedure.
    const std::optional<ReceiveProcedure> procedure =
        choice == kLineProtocol ? ReceiveProcedure::BccBlocks
                                : ProcedureOfStoredSelector(choice - uint32_t{1});
    if (!procedure)
        return kKeepInput;
    uint32_t seed = data[kSeedByte] | 1u;
    size_t offset = kStreamStart;

    ProtocolRig rig;
    auto feed = [&](FakePort& port) {
        if (offset >= size)
            return;
        seed = seed * 1103515245u + 12345u;
        const size_t burst = 1 + (seed >> 16) % 160;
        const size_t end = offset + burst < size ? offset + burst : size;
        port.Deliver(Bytes(data + offset, data + end));
        offset = end;
    };
    rig.port.onWrite = [&](const Bytes&, FakePort& port) { feed(port); };
    rig.port.onSilence = feed;
    feed(rig.port);

    SerialProtocol protocol(rig.port, rig.clock, rig.file, rig.callback, rig.texts, *procedure);
    protocol.SetPortOpen(true);
    // Any result will do: the fuzzer looks for crashes, leaks and undefined behaviour.
    if (choice == kLineProtocol)
        (void)protocol.ReceiveLines();
    else
        (void)protocol.Receive();
    (void)protocol.CheckInputFile(data + kStreamStart, size - kStreamStart);
    return kKeepInput;
}
