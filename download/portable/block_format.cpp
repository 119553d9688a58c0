// Byte layouts of the instrument protocol.
#include "download/portable/block_format.h"

#include <algorithm>
#include <cstdio>
#include <cstring>

using namespace serial_bytes;

void BuildCrcTable(CrcTable& table) noexcept {
    for (uint32_t i = 0; i < 256; ++i) {
        uint16_t crc = static_cast<uint16_t>(i << 8);
        for (int bit = 0; bit < 8; ++bit)
            crc = (crc & 0x8000) ? static_cast<uint16_t>((crc << 1) ^ 0x1021)
                                 : static_cast<uint16_t>(crc << 1);
        table[i] = crc;
    }
}

uint16_t Crc16(const CrcTable& table, const uint8_t* bytes, size_t count) noexcept {
    uint16_t crc = 0;
    for (size_t i = 0; i < count; ++i)
        crc = static_cast<uint16_t>((crc << 8) ^ table[((crc >> 8) ^ bytes[i]) & 0xFF]);
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
    while (end < capacity && line[end] != 0 && line[end] != kCr)
        ++end;
    if (end < 2)
        return false;
    // Remainder with the sign of the total, as the instrument computes it.
    const int32_t expected = SignedSum(line, end - 2) % 64 + 0x20;
    return expected == static_cast<int8_t>(line[end - 2]);
}

uint8_t LineCheckCharacter(const uint8_t* text, size_t count) noexcept {
    return static_cast<uint8_t>(SignedSum(text, count) % 64 + 0x20);
}

uint8_t ComputeBcc(const uint8_t* block) noexcept {
    uint8_t bcc = 0;
    for (size_t i = 1; i <= kBlockDataSize + 1; ++i)
        bcc ^= block[i];
    return bcc;
}

static uint16_t DecimalDigits(const uint8_t* digits, size_t count) noexcept {
    uint32_t value = 0;
    for (size_t i = 0; i < count && digits[i] >= '0' && digits[i] <= '9'; ++i)
        value = value * 10 + (digits[i] - '0');
    return static_cast<uint16_t>(value);
}

uint8_t ValidateBlock(const uint8_t* block, size_t count, const CrcTable& table,
                      uint16_t& receivedCheck) noexcept {
    switch (block[0]) {
        case kSoh: {
            receivedCheck = static_cast<uint16_t>((block[131] << 8) | block[132]);
            if (count == kYModemBlockNoCrc)
                return kAck;
            return Crc16(table, block + 3, kBlockDataSize) == receivedCheck ? kAck : kNak;
        }
        case kStx:
            receivedCheck = DecimalDigits(block + 130, 3);
            return ComputeBcc(block) == receivedCheck ? block[133] : kNak;
        case kEot:
            return kEot;
        default:
            return kNak;
    }
}

uint8_t MapBccReply(uint8_t reply) noexcept {
    if (reply == 0)
        return kNak;
    if (reply == kEtx)
        return kAck;
    return reply;
}

BccBlock BuildBccBlock(const uint8_t* text, size_t count, uint32_t blockNumber) noexcept {
    BccBlock block{};
    block[0] = kStx;
    count = std::min(count, kBlockDataSize);
    std::memcpy(block.data() + 1, text, count);
    if (count < kBlockDataSize) {
        size_t fillFrom = count;
        for (size_t i = 0; i + 1 < count; ++i) {
            if (text[i] == kCr && text[i + 1] == kLf) {
                fillFrom = i;
                break;
            }
        }
        std::memset(block.data() + 1 + fillFrom, ' ', kBlockDataSize - fillFrom);
    }
    block[129] = static_cast<uint8_t>('0' + blockNumber % 10);
    char digits[4];
    std::snprintf(digits, sizeof digits, "%03d", ComputeBcc(block.data()));
    std::memcpy(block.data() + 130, digits, 3);
    block[133] = kEtx;
    block[134] = kCr;
    block[135] = kLf;
    return block;
}

YModemBlock BuildYModemHeaderBlock(std::string_view fileName, uint32_t fileSize,
                                   uint32_t creationTime, const CrcTable& table) noexcept {
    YModemBlock block{};
    block[0] = kSoh;
    block[1] = 0;
    block[2] = 0xFF;
    char tail[48];
    const int tailLength = std::snprintf(tail, sizeof tail, "%u%c%u%c%c%c%c", fileSize, ' ',
                                         creationTime, ' ', 0, ' ', 0);
    // Name and its zero, then the tail must fit in the 128 data bytes.
    const size_t nameLength = std::min(fileName.size(), kBlockDataSize - 1 - tailLength);
    std::memcpy(block.data() + 3, fileName.data(), nameLength);
    std::memcpy(block.data() + 3 + nameLength + 1, tail, tailLength);
    const uint16_t crc = Crc16(table, block.data() + 3, kBlockDataSize);
    block[131] = static_cast<uint8_t>(crc >> 8);
    block[132] = static_cast<uint8_t>(crc);
    return block;
}

YModemHeaderInfo ParseYModemHeader(const uint8_t* block) noexcept {
    const char* text = reinterpret_cast<const char*>(block);
    size_t position = 3;
    const size_t nameStart = position;
    while (position < kBlockCapacity && text[position] != 0)
        ++position;
    YModemHeaderInfo info;
    info.Name = std::string_view(text + nameStart, position - nameStart);
    if (position < kBlockCapacity)
        ++position;
    const size_t sizeStart = position;
    while (position < kBlockCapacity && text[position] != ' ' && text[position] != 0)
        ++position;
    info.SizeText = std::string_view(text + sizeStart, position - sizeStart);
    uint64_t size = 0;
    for (char digit : info.SizeText) {
        if (digit < '0' || digit > '9')
            break;
        size = std::min<uint64_t>(size * 10 + (digit - '0'), UINT32_MAX);
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
        if (block[0] == kEot && length < kBlockCapacity)
            return check;
        if (length < kBlockCapacity || block[0] != kStx || block[129] != '0' + index % 10) {
            check.Result = BccFileCheck::Outcome::WrongBlock;
            return check;
        }
        check.ValueInBlock = DecimalDigits(block + 130, 3);
        check.Computed = ComputeBcc(block);
        if (check.ValueInBlock != check.Computed) {
            check.Result = BccFileCheck::Outcome::BccMismatch;
            return check;
        }
    }
    check.Result = BccFileCheck::Outcome::Valid;
    return check;
}
