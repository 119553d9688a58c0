// The conversions between the protocol's names and the numbers stored and posted for them.
#include "download/portable/protocol_vocabulary.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <iterator>
#include <set>

namespace {

constexpr ReceiveProcedure kProcedures[] = {
    ReceiveProcedure::RawStream,
    ReceiveProcedure::BccBlocks,
    ReceiveProcedure::YModem,
    ReceiveProcedure::RawStreamWithoutFlowControl,
};
constexpr MessageCode kCodes[] = {
    MessageCode::Information,
    MessageCode::Error,
    MessageCode::PortNotOpened,
};

// Each name has a number of its own, and that number gives the name back.
template <typename Name, size_t count, typename ToNumber, typename FromNumber>
void ExpectOwnNumbersThatComeBack(const Name (&names)[count], ToNumber toNumber,
                                  FromNumber fromNumber) {
    std::set<uint32_t> numbers;
    for (const Name name : names) {
        const uint32_t number = toNumber(name);
        EXPECT_TRUE(numbers.insert(number).second) << number << " stands for two names";
        EXPECT_EQ(fromNumber(number), name) << number;
    }
}

TEST(ProtocolVocabulary, EveryProcedureHasItsOwnStoredSelectorAndComesBackFromIt) {
    ExpectOwnNumbersThatComeBack(kProcedures, StoredSelectorOf, ProcedureOfStoredSelector);
}

TEST(ProtocolVocabulary, AStoredSelectorThatNamesNoProcedureIsRefused) {
    // A station's Protocol value is whatever the registry or a pasted block holds.
    int named = 0;
    for (uint32_t selector = 0; selector < 256; ++selector) {
        const auto procedure = ProcedureOfStoredSelector(selector);
        if (procedure) {
            ++named;
            EXPECT_EQ(StoredSelectorOf(*procedure), selector);
        }
    }
    EXPECT_EQ(named, static_cast<int>(std::size(kProcedures)));
    for (const uint32_t selector : {0x80000001u, 0xFFFFFFFFu})
        EXPECT_FALSE(ProcedureOfStoredSelector(selector)) << selector;
}

TEST(ProtocolVocabulary, PostedCodesComeBackAndOtherNumbersNameNoCode) {
    ExpectOwnNumbersThatComeBack(kCodes, PostedCodeOf,
                                 [](uint32_t number) { return MessageCodeOfPosted(number); });
    int named = 0;
    for (uint64_t number = 0; number < 256; ++number)
        named += MessageCodeOfPosted(number).has_value();
    EXPECT_EQ(named, static_cast<int>(std::size(kCodes)));
    // A window message's whole argument counts: a number above 32 bits is no code, whatever its
    // low bits say.
    for (const MessageCode code : kCodes)
        EXPECT_FALSE(MessageCodeOfPosted((uint64_t{1} << 32) | PostedCodeOf(code)));
}

}  // namespace
