// Byte layouts: line check, CRC-16, BCC and Y-Modem blocks, replies, input-file check, port set-up.
#include <gtest/gtest.h>

#include <cstdio>

#include "download/portable/port_setup.h"
#include "tests/portable/serial/fake_serial.h"

namespace {

TEST(LineCheck, SignedSumRemainderPlusSpaceAndBoundedLines) {
    const struct {
        std::string line;  // checked with its terminator
        bool passes;
    } cases[] = {
        {"1,=,\r\n", true},  // '1' + ',' = 0x31 + 0x2C = 93; 93 % 64 = 29; + 0x20 = 0x3D '='
        {"1,>,\r\n", false},
        {"1,=X\r\n", true},  // the character between the check character and CR is not summed
        // 0xC0 is -64, 0x81 is -127: total -191, remainder -63, + 0x20 = -31 = 0xE1.
        {"\xC0\x81\xE1,\r\n", true},
        {"\r\n", false},  // too short
        {"X\r\n", false},
        {" ,", true},  // check character ' ' for an empty sum
    };
    for (const auto& test : cases) {
        EXPECT_EQ(PassesLineCheck(BytesOf(test.line), test.line.size() + 1), test.passes)
            << test.line;
    }
    EXPECT_EQ(LineCheckCharacter(BytesOf("\xC0\x81"), 2), 0xE1);
    const uint8_t noTerminator[4] = {'A', 'B', 'C', 'D'};  // no CR within the bytes given
    EXPECT_FALSE(PassesLineCheck(noTerminator, sizeof noTerminator));
}

TEST(Crc16, MatchesTheStandardCheckValue) {
    EXPECT_EQ(Crc16(MakeCrcTable(), BytesOf("123456789"), 9), 0x31C3);
}

// What the blocks answer is proven by the receive procedures that validate them.
TEST(BccBlock, BuiltBlockCarriesTheTextCutAtItsLineEndDigitBccAndTerminator) {
    const std::string text = "line one\r\nrest is replaced";
    const BccBlock block = BuildBccBlock(BytesOf(text), text.size(), 13);
    char bcc[4] = {};
    std::snprintf(bcc, sizeof bcc, "%03d", ComputeBcc(block.data()));
    // STX, the text cut at its first CR LF and filled with spaces, digit, BCC, ETX CR LF.
    const std::string expected = "\x02line one" + std::string(120, ' ') + "3" + bcc + "\x03\r\n";
    EXPECT_EQ(std::string(block.begin(), block.end()), expected);
}

TEST(YModemBlock, HeaderCarriesNameSizeAndTimeAfterTheBlockNumber) {
    const YModemBlock header = BuildYModemHeaderBlock("survey.lv", 4321, 17, MakeCrcTable());
    EXPECT_EQ(std::string(header.begin() + 3, header.begin() + 27),
              std::string("survey.lv\0"
                          "4321 17 \0 \0\0\0\0",
                          24));
}

TEST(YModemBlock, HeaderParseStaysInsideAnUnterminatedBlock) {
    std::array<uint8_t, kBlockCapacity> buffer;
    buffer.fill('7');
    const YModemHeaderInfo info = ParseYModemHeader(buffer.data());
    EXPECT_EQ(info.Name.size(), kBlockCapacity - 3);
    EXPECT_TRUE(info.SizeText.empty());
}

std::vector<uint8_t> BlockFile(int blocks, bool endWithEot) {
    std::vector<uint8_t> file;
    for (int i = 0; i < blocks; ++i) {
        const std::string text = "block " + std::to_string(i);
        const BccBlock block = BuildBccBlock(BytesOf(text), text.size(), i);
        file.insert(file.end(), block.begin(), block.end());
    }
    if (endWithEot)
        file.push_back(0x04);
    return file;
}

TEST(InputFileCheck, NumberedBlocksPassAndABccMismatchIsReportedWithItsNumbers) {
    ProtocolRun run(ReceiveProcedure::BccBlocks);
    std::vector<uint8_t> file = BlockFile(12, true);  // digits wrap from 9 to 0
    EXPECT_TRUE(run.protocol.CheckInputFile(file.data(), file.size()));
    const uint8_t stored = ComputeBcc(file.data() + 136);
    file[136 + 10] ^= 0x01;  // a bit of block 1's text
    EXPECT_FALSE(run.protocol.CheckInputFile(file.data(), file.size()));
    const std::string expected = "Incorrect input file: BCC in block 1 mismatch with computed " +
                                 std::to_string(stored) + "!=" + std::to_string(stored ^ 1);
    EXPECT_EQ(run.callback.messages,
              OnlyMessage(MessageCode::Error, WidenBytes(expected.data(), expected.size())));
    EXPECT_TRUE(run.protocol.IsFileOpened());
}

TEST(InputFileCheck, WhatIsNotABlockFilePassesButIsNotedAsNotOpened) {
    std::vector<uint8_t> wrongDigit = BlockFile(3, true);
    wrongDigit[136 * 2 + 129] = '7';
    const std::vector<uint8_t> files[] = {wrongDigit, ToBytes("plain text"), {}};
    for (const auto& file : files) {
        ProtocolRun run(ReceiveProcedure::BccBlocks);
        EXPECT_TRUE(run.protocol.CheckInputFile(file.data(), file.size())) << file.size();
        EXPECT_FALSE(run.protocol.IsFileOpened()) << file.size();
        EXPECT_TRUE(run.callback.messages.empty());
    }
}

TEST(PortSetup, FlowControlOnlyForTheRawStream) {
    // XON/XOFF in and out.
    EXPECT_EQ(MakeDeviceControlFields(ReceiveProcedure::RawStream).Flags, 0x1393u);
    for (const ReceiveProcedure procedure :
         {ReceiveProcedure::BccBlocks, ReceiveProcedure::YModem,
          ReceiveProcedure::RawStreamWithoutFlowControl})
        EXPECT_EQ(MakeDeviceControlFields(procedure).Flags, 0x1093u)
            << StoredSelectorOf(procedure);
}

// Lines are framed by CR LF: a read ends once the bytes stop for about two character times.
// Blocks keep the 50 ms silence that frames them.
TEST(PortSetup, LineTimeoutsWaitAboutTwoCharacterTimesAfterTheLastByte) {
    const struct {
        uint32_t baud;
        uint32_t bits;
        uint32_t interval;
    } cases[] = {
        {300, 10, 67}, {1200, 10, 17}, {9600, 10, 3}, {19200, 10, 2},
        {38400, 10, 1}, {115200, 10, 1}, {9600, 11, 3}, {4800, 11, 5},
    };
    for (const auto& test : cases) {
        const PortTimeouts line = MakeLineTimeouts(test.baud, test.bits);
        EXPECT_EQ(line.ReadInterval, test.interval) << test.baud << " baud, " << test.bits;
        EXPECT_EQ(line.ReadTotalMultiplier, 0u);
        EXPECT_EQ(line.ReadTotalConstant, 100u) << "a silent line still waits 100 ms a read";
        EXPECT_EQ(line.WriteTotalConstant, MakePortTimeouts().WriteTotalConstant);
    }
    const PortTimeouts blocks = MakePortTimeouts();
    EXPECT_EQ(blocks.ReadInterval, 50u);
    EXPECT_EQ(blocks.ReadTotalMultiplier, 1u);
    EXPECT_EQ(blocks.ReadTotalConstant, 100u);
    EXPECT_EQ(MakeLineTimeouts(0, 10).ReadInterval, 50u) << "no rate: the block time-outs";
}

TEST(TextFormat, ArgumentsFillConversionsInOrderAndMissingOnesAreDropped) {
    EXPECT_EQ(FormatText(WIDE_TEXT("block %d: %d!=%d, 100%%"),
                         {WIDE_TEXT("2"), WIDE_TEXT("17"), WIDE_TEXT("18")}),
              WIDE_TEXT("block 2: 17!=18, 100%"));
    EXPECT_EQ(FormatText(WIDE_TEXT("%s and %s %"), {WIDE_TEXT("one")}), WIDE_TEXT("one and  %"));
}

}  // namespace
