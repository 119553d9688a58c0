// Byte layouts of the instrument protocol: line check, BCC and Y-Modem blocks, replies, CRC-16.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <string_view>

namespace serial_bytes {
constexpr uint8_t kNul = 0x00;  // what an unwritten byte of a block reads as
constexpr uint8_t kSoh = 0x01;
constexpr uint8_t kStx = 0x02;
constexpr uint8_t kEtx = 0x03;
constexpr uint8_t kEot = 0x04;
constexpr uint8_t kEnq = 0x05;
constexpr uint8_t kAck = 0x06;
constexpr uint8_t kNak = 0x15;
constexpr uint8_t kCan = 0x18;
constexpr uint8_t kCrcRequest = 0x43;  // 'C'
constexpr uint8_t kCr = 0x0D;
constexpr uint8_t kLf = 0x0A;
}  // namespace serial_bytes

constexpr size_t kLineCapacity = 128;   // bytes of one line, CR LF included
constexpr size_t kBlockCapacity = 136;  // bytes of the largest block (kind 2)
constexpr size_t kBlockDataSize = 128;
constexpr size_t kBlockKindOffset = 0;  // the first byte of a block names its kind

// A kind-2 (BCC) block: kind, 128 data bytes, block digit, three BCC digits, terminator, CR, LF.
constexpr size_t kBccDataOffset = 1;
constexpr size_t kBccDigitOffset = kBccDataOffset + kBlockDataSize;
constexpr size_t kBccCheckOffset = kBccDigitOffset + 1;
constexpr size_t kBccCheckDigits = 3;
constexpr size_t kBccTerminatorOffset = kBccCheckOffset + kBccCheckDigits;
constexpr size_t kBccCrOffset = kBccTerminatorOffset + 1;
constexpr size_t kBccLfOffset = kBccCrOffset + 1;
static_assert(kBccLfOffset + 1 == kBlockCapacity);

// A kind-1 (Y-Modem) block: kind, block number, 255 minus the number, 128 data bytes, CRC high
// byte, CRC low byte.
constexpr size_t kYModemNumberOffset = 1;
constexpr size_t kYModemComplementOffset = 2;
constexpr size_t kYModemDataOffset = 3;
constexpr size_t kYModemCrcOffset = kYModemDataOffset + kBlockDataSize;
constexpr size_t kYModemBlockSize = kYModemCrcOffset + 2;  // with its two CRC bytes
constexpr size_t kYModemBlockNoCrc = kYModemCrcOffset;     // accepted without a check

constexpr size_t kByteValues = 256;
using CrcTable = std::array<uint16_t, kByteValues>;
using BccBlock = std::array<uint8_t, kBlockCapacity>;
using YModemBlock = std::array<uint8_t, kYModemBlockSize>;

// CRC-16, polynomial 0x1021, most significant bit first: entry i is the CRC of byte i.
void BuildCrcTable(CrcTable& table) noexcept;
[[nodiscard]] uint16_t Crc16(const CrcTable& table, const uint8_t* bytes, size_t count) noexcept;

// The line check of one received line (zero-terminated within capacity bytes): the character two
// before the first CR must equal (signed sum of the bytes before it, remainder 64) + 0x20.
[[nodiscard]] bool PassesLineCheck(const uint8_t* line, size_t capacity) noexcept;
// The check character that makes text (the bytes before the check character) pass.
[[nodiscard]] uint8_t LineCheckCharacter(const uint8_t* text, size_t count) noexcept;

// XOR of the 129 bytes from the first data byte of a kind-2 block to its block digit.
[[nodiscard]] uint8_t ComputeBcc(const uint8_t* block) noexcept;

// The reply a received block earns: kind 1 ACK or NAK by its CRC (a 131-byte burst passes
// unchecked), kind 2 its terminator byte when the BCC matches else NAK, kind 4 EOT, else NAK.
// receivedCheck gets the block's CRC or BCC value. block must hold kBlockCapacity bytes, of which
// count were received (the rest zero).
[[nodiscard]] uint8_t ValidateBlock(const uint8_t* block, size_t count, const CrcTable& table,
                                    uint16_t& receivedCheck) noexcept;

// The block protocol's reading of a reply: NUL → NAK, ETX → ACK, every other value as it is.
[[nodiscard]] uint8_t MapBccReply(uint8_t reply) noexcept;

// A kind-2 block from up to 128 bytes of text: short text is filled with spaces from its first
// CR LF (or its end); digit '0' + blockNumber % 10, BCC as "%03d", ETX, CR, LF.
BccBlock BuildBccBlock(const uint8_t* text, size_t count, uint32_t blockNumber) noexcept;

// The Y-Modem header block (number 0): name, 0, size, ' ', creation time, ' ', 0, ' ', 0, zeros,
// CRC high byte first. A name too long for the block is cut.
YModemBlock BuildYModemHeaderBlock(std::string_view fileName, uint32_t fileSize,
                                   uint32_t creationTime, const CrcTable& table) noexcept;

// What a received Y-Modem header block announces.
struct YModemHeaderInfo {
    std::string_view Name;
    std::string_view SizeText;
    uint32_t Size = 0;
};
// block holds kBlockCapacity bytes; the scan never leaves them.
[[nodiscard]] YModemHeaderInfo ParseYModemHeader(const uint8_t* block) noexcept;

// Result of checking a file made of kind-2 blocks numbered 0, 1, 2 … and ended by EOT.
struct BccFileCheck {
    enum class Outcome { Valid, WrongBlock, BccMismatch } Result = Outcome::Valid;
    uint32_t Block = 0;
    uint32_t ValueInBlock = 0;
    uint32_t Computed = 0;
};
[[nodiscard]] BccFileCheck CheckBccBlocks(const uint8_t* bytes, size_t size) noexcept;
