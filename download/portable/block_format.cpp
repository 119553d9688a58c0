// Byte layouts of the instrument protocol.
#include "download/portable/block_format.h"

#include <algorithm>
#include <cstdio>
#include <cstring>

using namespace serial_bytes;

namespace {

// CRC-16 as Y-Modem computes it: polynomial x^16 + x^12 + x^5 + 1, most significant bit first.
constexpr uint16_t kCrcPolynomial = 0x1021;
constexpr uint16_t kCrcTopBit = 0x8000;
constexpr int kBitsPerByte = 8;
// Y-Modem numbers the header block, which carries the file's name and size, 0.
constexpr uint8_t kYModemHeaderNumber = 0;
// The line check: the signed sum's remainder, moved into printable text.
constexpr int32_t kLineCheckModulus = 64;
constexpr int32_t kLineCheckBase = 0x20;
constexpr uint32_t kDecimalBase = 10;

}  // namespace

void BuildCrcTable(CrcTable& table) noexcept {
    for (uint32_t i = 0; i < kByteValues; ++i) {
        uint16_t crc = static_cast<uint16_t>(i << kBitsPerByte);
        for (int bit = 0; bit < kBitsPerByte; ++bit)
            crc = (crc & kCrcTopBit) ? static_cast<uint16_t>((crc << 1) ^ kCrcPolynomial)
                                     : static_cast<uint16_t>(crc << 1);
        table[i] = crc;
    }
}

uint16_t Crc16(const CrcTable& table, const uint8_t* bytes, size_t count) noexcept {
    uint16_t crc = 0;
    for (size_t i = 0; i < count; ++i)
        crc = static_cast<uint16_t>((crc << kBitsPerByte) ^
                                    table[((crc >> kBitsPerByte) ^ bytes[i]) & 0xFF]);
    return crc;
}

static int32_t SignedSum(const uint8_t* bytes, size_t count) noexcept {
    int32_t total = 0;
    for (size_t i = 0; i < count; ++i)
        total += static_cast<int8_t>(bytes[i]);
    return total;
}

bool PassesLineCheck(const uint8_t* line, size_t capacity) noexcept {
    size_t end = 0;  // the first CR, or the terminator
    while (end < capacity && line[end] != kNul && line[end] != kCr)
        ++end;
    // The check character stands two before the CR: one more character follows it.
    constexpr size_t kCheckBeforeEnd = 2;
    if (end < kCheckBeforeEnd)
        return false;
    // Remainder with the sign of the total, as the instrument computes it.
    const int32_t expected =
        SignedSum(line, end - kCheckBeforeEnd) % kLineCheckModulus + kLineCheckBase;
    return expected == static_cast<int8_t>(line[end - kCheckBeforeEnd]);
}

uint8_t LineCheckCharacter(const uint8_t* text, size_t count) noexcept {
    return static_cast<uint8_t>(SignedSum(text, count) % kLineCheckModulus + kLineCheckBase);
}

uint8_t ComputeBcc(const uint8_t* block) noexcept {
    uint8_t bcc = 0;
    for (size_t i = kBccDataOffset; i <= kBccDigitOffset; ++i)
        bcc ^= block[i];
    return bcc;
}

static uint16_t DecimalDigits(const uint8_t* digits, size_t count) noexcept {
    uint32_t value = 0;
    for (size_t i = 0; i < count && digits[i] >= '0' && digits[i] <= '9'; ++i)
        value = value * kDecimalBase + (digits[i] - '0');
    return static_cast<uint16_t>(value);
}

uint8_t ValidateBlock(const uint8_t* block, size_t count, const CrcTable& table,
                      uint16_t& receivedCheck) noexcept {
    switch (block[kBlockKindOffset]) {
        case kSoh: {
            receivedCheck = static_cast<uint16_t>((block[kYModemCrcOffset] << kBitsPerByte) |
                                                  block[kYModemCrcOffset + 1]);
            if (count == kYModemBlockNoCrc)
                return kAck;
            return Crc16(table, block + kYModemDataOffset, kBlockDataSize) == receivedCheck ? kAck
                                                                                            : kNak;
        }
        case kStx:
            receivedCheck = DecimalDigits(block + kBccCheckOffset, kBccCheckDigits);
            return ComputeBcc(block) == receivedCheck ? block[kBccTerminatorOffset] : kNak;
        case kEot:
            return kEot;
        default:
            return kNak;
    }
}

uint8_t MapBccReply(uint8_t reply) noexcept {
    if (reply == kNul)
        return kNak;
    if (reply == kEtx)
        return kAck;
    return reply;
}

BccBlock BuildBccBlock(const uint8_t* text, size_t count, uint32_t blockNumber) noexcept {
    BccBlock block{};
    block[kBlockKindOffset] = kStx;
    count = std::min(count, kBlockDataSize);
    std::memcpy(block.data() + kBccDataOffset, text, count);
    if (count < kBlockDataSize) {
        size_t fillFrom = count;
        for (size_t i = 0; i + 1 < count; ++i) {
            if (text[i] == kCr && text[i + 1] == kLf) {
                fillFrom = i;
                break;
            }
        }
        std::memset(block.data() + kBccDataOffset + fillFrom, ' ', kBlockDataSize - fillFrom);
    }
    block[kBccDigitOffset] = static_cast<uint8_t>('0' + blockNumber % kDecimalBase);
    char digits[kBccCheckDigits + 1];
    std::snprintf(digits, sizeof digits, "%03d", ComputeBcc(block.data()));
    std::memcpy(block.data() + kBccCheckOffset, digits, kBccCheckDigits);
    block[kBccTerminatorOffset] = kEtx;
    block[kBccCrOffset] = kCr;
    block[kBccLfOffset] = kLf;
    return block;
}

YModemBlock BuildYModemHeaderBlock(std::string_view fileName, uint32_t fileSize,
                                   uint32_t creationTime, const CrcTable& table) noexcept {
    YModemBlock block{};
    block[kBlockKindOffset] = kSoh;
    block[kYModemNumberOffset] = kYModemHeaderNumber;
    block[kYModemComplementOffset] = static_cast<uint8_t>(0xFF - kYModemHeaderNumber);
    char tail[48];
    const int tailLength = std::snprintf(tail, sizeof tail, "%u%c%u%c%c%c%c", fileSize, ' ',
                                         creationTime, ' ', kNul, ' ', kNul);
    // Name and its zero, then the tail must fit in the 128 data bytes.
    const size_t nameLength = std::min(fileName.size(), kBlockDataSize - 1 - tailLength);
    std::memcpy(block.data() + kYModemDataOffset, fileName.data(), nameLength);
    std::memcpy(block.data() + kYModemDataOffset + nameLength + 1, tail, tailLength);
    const uint16_t crc = Crc16(table, block.data() + kYModemDataOffset, kBlockDataSize);
    block[kYModemCrcOffset] = static_cast<uint8_t>(crc >> kBitsPerByte);
    block[kYModemCrcOffset + 1] = static_cast<uint8_t>(crc);
    return block;
}

YModemHeaderInfo ParseYModemHeader(const uint8_t* block) noexcept {
    const char* text = reinterpret_cast<const char*>(block);
    size_t position = kYModemDataOffset;
    const size_t nameStart = position;
    while (position < kBlockCapacity && text[position] != kNul)
        ++position;
    YModemHeaderInfo info;
    info.Name = std::string_view(text + nameStart, position - nameStart);
    if (position < kBlockCapacity)
        ++position;
    const size_t sizeStart = position;
    while (position < kBlockCapacity && text[position] != ' ' && text[position] != kNul)
        ++position;
    info.SizeText = std::string_view(text + sizeStart, position - sizeStart);
    uint64_t size = 0;
    for (char digit : info.SizeText) {
        if (digit < '0' || digit > '9')
            break;
        size = std::min<uint64_t>(size * kDecimalBase + (digit - '0'), UINT32_MAX);
    }
    info.Size = static_cast<uint32_t>(size);
    return info;
}

BccFileCheck CheckBccBlocks(const uint8_t* bytes, size_t size) noexcept {
    BccFileCheck check;
    if (size == 0) {
        check.Result = BccFileCheck::Outcome::WrongBlock;
        return check;
    }
    for (size_t offset = 0, index = 0; offset < size; offset += kBlockCapacity, ++index) {
        const size_t length = std::min(kBlockCapacity, size - offset);
        const uint8_t* block = bytes + offset;
        check.Block = static_cast<uint32_t>(index);
        if (block[kBlockKindOffset] == kEot && length < kBlockCapacity)
            return check;
        if (length < kBlockCapacity || block[kBlockKindOffset] != kStx ||
            block[kBccDigitOffset] != '0' + index % kDecimalBase) {
            check.Result = BccFileCheck::Outcome::WrongBlock;
            return check;
        }
        check.ValueInBlock = DecimalDigits(block + kBccCheckOffset, kBccCheckDigits);
        check.Computed = ComputeBcc(block);
        if (check.ValueInBlock != check.Computed) {
            check.Result = BccFileCheck::Outcome::BccMismatch;
            return check;
        }
    }
    check.Result = BccFileCheck::Outcome::Valid;
    return check;
}
