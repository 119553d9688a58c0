// Arbitrary byte streams, in arbitrary bursts, fed to each receive procedure of the driver.
#include <cstddef>
#include <cstdint>

#include "download/portable/serial_protocol.h"
#include "tests/portable/serial/fake_serial.h"

// Input: [procedure] [burst seed] stream... Procedure 0 is the line protocol, 1-4 the selectors
// 0-3 of Receive. Each answer the driver writes, and each silence, lets the next burst arrive.
extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    if (size < 2)
        return 0;
    const uint8_t procedure = data[0] % 5;
    uint32_t seed = data[1] | 1u;
    size_t offset = 2;

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

    SerialProtocol protocol(rig.port, rig.clock, rig.file, rig.callback, rig.texts,
                            procedure == 0 ? 1 : procedure - 1);
    protocol.SetPortOpen(true);
    if (procedure == 0)
        (void)protocol.ReceiveLines();
    else
        (void)protocol.Receive();
    (void)protocol.CheckInputFile(data + 2, size - 2);
    return 0;
}
