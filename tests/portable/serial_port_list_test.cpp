// The serial-port list from the values another program left in the system's serial-port key.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "stations/portable/serial_port_list.h"
#include "support/portable/byte_io.h"
#include "tests/portable/registry_bytes.h"

namespace {

using Ports = std::vector<WideString>;

// A value as the key holds it; the bytes live in the test case.
struct StoredValue {
    WideString name;
    RegistryValueType type;
    std::vector<uint8_t> data;
};

StoredValue Port(WideStringView device, WideStringView port) {
    return {WideString(device), RegistryValueType::kText, Terminated(port)};
}

Ports Build(const std::vector<StoredValue>& stored) {
    std::vector<SerialCommValue> values;
    for (const StoredValue& value : stored)
        values.push_back({value.name, value.type, value.data});
    return BuildSerialPortList(values);
}

}  // namespace

TEST(SerialPortList, PortsComeInTheKeysOrderUpToTheFirstValueThatEndsTheList) {
    const WideString name63(63, WIDE_TEXT('n'));
    const WideString name64(64, WIDE_TEXT('n'));
    std::vector<uint8_t> odd = Units(WIDE_TEXT("COM8"));
    odd.push_back('8');
    std::vector<uint8_t> withNul = Terminated(WIDE_TEXT("COM2"));
    withNul.insert(withNul.end(), {'X', 0});
    using enum RegistryValueType;
    const WideString a = WIDE_TEXT("a"), c = WIDE_TEXT("c");
    const WideString com3 = WIDE_TEXT("COM3"), com4 = WIDE_TEXT("COM4");
    const WideString units64(64, WIDE_TEXT('C'));
    const struct {
        const char* what;
        std::vector<StoredValue> values;
        Ports ports;
    } cases[] = {
        {"no values", {}, {}},
        {"unsorted and duplicated, as listed",
         {Port(WIDE_TEXT("\\Device\\Serial1"), com4), Port(WIDE_TEXT("\\Device\\Serial0"), com3),
          Port(WIDE_TEXT("\\Device\\Serial2"), com4)},
         {com4, com3, com4}},
        {"a number ends the list",
         {Port(a, com3), {WIDE_TEXT("b"), kNumber, {5, 0, 0, 0}}, Port(c, WIDE_TEXT("COM9"))},
         {com3}},
        {"only REG_SZ counts as text", {{a, kExpandText, Terminated(com3)}}, {}},
        {"binary bytes that spell a port", {{a, kBinary, Terminated(com3)}}, {}},
        {"an unknown type", {{a, RegistryValueType(0x80000001), {}}}, {}},
        {"a name of 63 characters fits", {Port(name63, WIDE_TEXT("COM5"))}, {WIDE_TEXT("COM5")}},
        {"a name of 64 does not",
         {Port(a, com3), Port(name64, WIDE_TEXT("COM5")), Port(c, WIDE_TEXT("COM6"))},
         {com3}},
        {"128 bytes without terminator fill the buffer", {{a, kText, Units(units64)}}, {units64}},
        {"64 characters and a terminator do not fit", {{a, kText, Terminated(units64)}}, {}},
        {"129 bytes", {{a, kText, std::vector<uint8_t>(129, 'C')}}, {}},
        {"an odd byte count", {{a, kText, odd}}, {WIDE_TEXT("COM8")}},
        {"a NUL inside", {{a, kText, withNul}}, {WIDE_TEXT("COM2")}},
        {"empty data is an empty port",
         {{a, kText, {}}, {WIDE_TEXT("b"), kText, {'C'}}, Port(c, WIDE_TEXT("COM1"))},
         {WideString(), WideString(), WIDE_TEXT("COM1")}},
    };
    for (const auto& test : cases)
        EXPECT_EQ(test.ports, Build(test.values)) << test.what;
}

TEST(SerialPortList, AValueThatEndsTheListIsNotAppended) {
    Ports ports = {WIDE_TEXT("COM1")};
    const std::vector<uint8_t> data = Terminated(WIDE_TEXT("COM2"));
    EXPECT_FALSE(AppendSerialPort({WIDE_TEXT("x"), RegistryValueType::kBinary, data}, ports));
    EXPECT_EQ(Ports{WIDE_TEXT("COM1")}, ports);
    EXPECT_TRUE(AppendSerialPort({WIDE_TEXT("x"), RegistryValueType::kText, data}, ports));
    EXPECT_EQ((Ports{WIDE_TEXT("COM1"), WIDE_TEXT("COM2")}), ports);
}
