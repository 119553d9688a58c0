// Unique names for new and pasted stations, the names the store can keep and list, the limits of
// a pasted block, and what a station's model decides.
#include <gtest/gtest.h>

#include <set>
#include <string>

#include "res/ids_stations.h"
#include "stations/portable/model_rules.h"
#include "stations/portable/pasted_stations.h"
#include "stations/portable/station_list_format.h"
#include "stations/portable/station_names.h"

namespace {

NameTakenPredicate TakenAmong(const std::set<WideString>& names) {
    return [names](const WideString& name) { return names.count(name) != 0; };
}

WideString Numbered(const WideString& base, int number) {
    const std::string digits = std::to_string(number);
    return base + WIDE_TEXT(" (") + WideString(digits.begin(), digits.end()) + WIDE_TEXT(")");
}

}  // namespace

TEST(StationNames, UniqueNameIsTheBaseOrTheFirstFreeNumberFromTwo) {
    const WideString base = WIDE_TEXT("New digital level");
    std::set<WideString> upToEleven = {base};
    for (int number = 2; number <= 11; ++number)
        upToEleven.insert(Numbered(base, number));
    const struct {
        std::set<WideString> taken;
        WideString expected;
    } cases[] = {
        {{}, base},
        {{base}, Numbered(base, 2)},
        {{base, Numbered(base, 2)}, Numbered(base, 3)},
        {{base, Numbered(base, 3)}, Numbered(base, 2)},  // "(1)" is never produced
        {upToEleven, Numbered(base, 12)},
    };
    for (const auto& test : cases)
        EXPECT_EQ(test.expected, MakeUniqueName(base, TakenAmong(test.taken)));
}

TEST(StationNames, PastedNameGetsThePrefixUntilFree) {
    const WideString copyOf = WIDE_TEXT("Copy of ");
    EXPECT_EQ(WIDE_TEXT("North"), MakePastedName(WIDE_TEXT("North"), copyOf, TakenAmong({})));
    EXPECT_EQ(WIDE_TEXT("Copy of Copy of North"),
              MakePastedName(WIDE_TEXT("North"), copyOf,
                             TakenAmong({WIDE_TEXT("North"), WIDE_TEXT("Copy of North")})));
    // Without a prefix text there is nothing to try: the name comes back as it was.
    EXPECT_EQ(WIDE_TEXT("North"),
              MakePastedName(WIDE_TEXT("North"), WIDE_TEXT(""), TakenAmong({WIDE_TEXT("North")})));
}

// A valid name has no path or wildcard character; the store also bounds its length, and the
// folder lists what it can open again by that name.
TEST(StationNames, TheStoreKeepsOnlyNamesItReadsBackAndTheFolderListsAsThemselves) {
    using enum StationNameProblem;
    const struct {
        WideString name;
        bool valid;
        StationNameProblem problem;
        bool listable;  // when another program stored it
    } cases[] = {
        {WIDE_TEXT("Level 3 (north)"), true, kNone, true},
        {WideString(259, WIDE_TEXT('L')), true, kNone, true},
        {WideString(260, WIDE_TEXT('L')), true, kTooLong, false},
        {WIDE_TEXT(""), false, kEmpty, false},
        {WIDE_TEXT("Site\\North"), false, kForbiddenCharacter, false},
        {WIDE_TEXT("\\"), false, kForbiddenCharacter, false},
        {WIDE_TEXT("a/b"), false, kForbiddenCharacter, true},
        {WIDE_TEXT("say \"x\""), false, kForbiddenCharacter, true},
        {WIDE_TEXT("st*r"), false, kForbiddenCharacter, true},
        {WIDE_TEXT("tab\tand line\r\n"), true, kNone, true},
    };
    for (const auto& test : cases) {
        EXPECT_EQ(test.valid, IsValidStationName(test.name)) << test.name.size();
        EXPECT_EQ(test.problem, CheckStationName(test.name)) << test.name.size();
        EXPECT_EQ(test.listable, IsListableStationName(test.name)) << test.name.size();
    }
}

namespace {

std::vector<Station> NamedStations(std::initializer_list<WideString> names) {
    std::vector<Station> stations;
    for (const WideString& name : names) {
        Station station;
        station.Name = name;
        stations.push_back(station);
    }
    return stations;
}

const WideString kCopyOf = WIDE_TEXT("Copy of ");

}  // namespace

TEST(PastedStations, NamesAreChosenAgainstTheStoreAndTheNamesChosenBefore) {
    const WideString A = WIDE_TEXT("A"), B = WIDE_TEXT("B");
    const WideString copyOfA = kCopyOf + A;
    const struct {
        const char* what;
        std::set<WideString> stored;
        std::vector<Station> pasted;
        std::vector<WideString> names;
    } cases[] = {
        // clang-format off
        {"free names stay", {B}, NamedStations({A}), {A}},
        {"a stored name gets the prefix until free", {A, copyOfA}, NamedStations({A}),
         {kCopyOf + copyOfA}},
        {"the same name twice in the block", {A}, NamedStations({A, A, B}),
         {copyOfA, kCopyOf + copyOfA, B}},
        {"a name the block brings before its copy", {}, NamedStations({copyOfA, A, A}),
         {copyOfA, A, kCopyOf + copyOfA}},
        {"names differing in case are different", {WIDE_TEXT("a")}, NamedStations({A}), {A}},
        // clang-format on
    };
    for (const auto& test : cases) {
        const PastedNames chosen =
            ChoosePastedNames(test.pasted, {test.stored.begin(), test.stored.end()}, kCopyOf);
        EXPECT_FALSE(chosen.refused) << test.what;
        EXPECT_EQ(test.names, chosen.names) << test.what;
        // Station by station, the rule of a single paste over everything stored before it.
        std::set<WideString> taken = test.stored;
        for (size_t index = 0; index < test.pasted.size() && index < chosen.names.size(); ++index) {
            EXPECT_EQ(MakePastedName(test.pasted[index].Name, kCopyOf, TakenAmong(taken)),
                      chosen.names[index])
                << test.what;
            taken.insert(chosen.names[index]);
        }
    }
}

TEST(PastedStations, TheFirstStationTheStoreCannotKeepRefusesTheWholeBlock) {
    using enum PasteRefusal;
    using enum StationNameProblem;
    const WideString long251(251, WIDE_TEXT('L'));
    const WideString long252(252, WIDE_TEXT('L'));
    const WideString long255(255, WIDE_TEXT('L'));
    const WideString a = WIDE_TEXT("A");
    std::vector<Station> longPort = NamedStations({a, WIDE_TEXT("B")});
    longPort[1].Port = WideString(260, WIDE_TEXT('P'));
    const struct {
        const char* what;
        std::set<WideString> stored;
        std::vector<Station> pasted;
        std::optional<PasteRefusal> reason;
        size_t station;
        StationNameProblem problem;
    } cases[] = {
        // clang-format off
        {"empty name", {}, NamedStations({a, WIDE_TEXT(""), WIDE_TEXT("a\\b")}), kUnreadable, 1,
         kEmpty},
        {"backslash", {}, NamedStations({WIDE_TEXT("Site\\North"), WIDE_TEXT("")}), kUnreadable, 0,
         kForbiddenCharacter},
        {"slash after a good one", {}, NamedStations({a, WIDE_TEXT("c/d")}), kUnreadable, 1,
         kForbiddenCharacter},
        {"260 characters", {}, NamedStations({WideString(260, 'L')}), kUnreadable, 0, kTooLong},
        {"a port of 260 characters", {}, longPort, kUnreadable, 1, kNone},
        {"251 characters as a copy fit", {long251}, NamedStations({long251}), {}, 0, kNone},
        {"252 characters as a copy do not", {long252}, NamedStations({long252}), kCopyTooLong, 0,
         kNone},
        {"255 characters pasted over themselves", {long255}, NamedStations({long255}), kCopyTooLong,
         0, kNone},
        {"the second copy in one block is too long", {}, NamedStations({long251, long251, long251}),
         kCopyTooLong, 2, kNone},
        // clang-format on
    };
    for (const auto& test : cases) {
        const PastedNames chosen =
            ChoosePastedNames(test.pasted, {test.stored.begin(), test.stored.end()}, kCopyOf);
        ASSERT_EQ(test.reason.has_value(), chosen.refused.has_value()) << test.what;
        if (!test.reason) {
            EXPECT_EQ(test.pasted.size(), chosen.names.size()) << test.what;
            continue;
        }
        EXPECT_TRUE(chosen.names.empty()) << test.what;
        EXPECT_EQ(*test.reason, chosen.refused->reason) << test.what;
        EXPECT_EQ(test.station, chosen.refused->station) << test.what;
        EXPECT_EQ(test.pasted[test.station].Name, chosen.refused->name) << test.what;
        EXPECT_EQ(test.problem, chosen.refused->nameProblem) << test.what;
    }
    // A prefix that would make a name the store refuses is no way out either.
    const PastedNames slashed =
        ChoosePastedNames(NamedStations({WIDE_TEXT("A")}), {WIDE_TEXT("A")}, WIDE_TEXT("Copy/"));
    ASSERT_TRUE(slashed.refused);
    EXPECT_EQ(kUnreadable, slashed.refused->reason);
}

TEST(PastedStations, BlocksOverTheStationFileLimitsAreRefusedBeforeDecoding) {
    const auto blockOf = [](uint32_t count, size_t size) {
        std::vector<uint8_t> block(size);
        for (int i = 0; i < 4 && static_cast<size_t>(i) < size; ++i)
            block[i] = static_cast<uint8_t>(count >> (8 * i));
        return block;
    };
    const struct {
        const char* what;
        std::vector<uint8_t> block;
        std::optional<PasteRefusal> reason;
    } cases[] = {
        {"1,000 stations", blockOf(1000, 64), std::nullopt},
        {"1,001 stations", blockOf(1001, 64), PasteRefusal::kTooManyStations},
        {"a negative count is an empty list", blockOf(0xFFFFFFFF, 64), std::nullopt},
        {"a count of 2^31", blockOf(0x80000000, 64), std::nullopt},
        {"a block too short for its count", blockOf(5000, 3), std::nullopt},
        {"exactly 1 MiB", blockOf(1, 1024 * 1024), std::nullopt},
        {"1 MiB and a byte", blockOf(1, 1024 * 1024 + 1), PasteRefusal::kBlockTooLarge},
    };
    for (const auto& test : cases) {
        const std::optional<PasteRefused> refused =
            CheckPastedBlock(test.block.data(), test.block.size());
        EXPECT_EQ(test.reason.has_value(), refused.has_value()) << test.what;
        if (test.reason && refused) {
            EXPECT_EQ(*test.reason, refused->reason) << test.what;
        }
    }
    // The names themselves cannot pass the count either, however they were decoded.
    const std::vector<Station> many(kMaximumPastedStations + 1, NamedStations({WIDE_TEXT("A")})[0]);
    const PastedNames chosen = ChoosePastedNames(many, {}, kCopyOf);
    ASSERT_TRUE(chosen.refused);
    EXPECT_EQ(PasteRefusal::kTooManyStations, chosen.refused->reason);
}

TEST(PastedStations, MessagesQuoteAShortPrintableName) {
    EXPECT_EQ(WIDE_TEXT("North"), NameForMessage(WIDE_TEXT("North")));
    EXPECT_EQ(WIDE_TEXT("a\xFFFD\xFFFD"
                        "b\xFFFD"),
              NameForMessage(WIDE_TEXT("a\r\nb\x1B")));
    EXPECT_EQ(WideString(64, WIDE_TEXT('L')) + WIDE_TEXT("\x2026"),
              NameForMessage(WideString(100000, WIDE_TEXT('L'))));
}

TEST(ModelRules, OnlyTheExactTextsOfTheTwoLibraryModelsLeaveTheBuiltInDriver) {
    using enum ModelKind;
    const struct {
        const WideChar* model;
        ModelKind kind;
        WideString file;
        uint32_t instructions;
    } cases[] = {
        {WIDE_TEXT("Quorvel LV-10"), kBuiltInDriver, WIDE_TEXT("file1.lv"), IDS_INSTRUCTIONS_LV10},
        {WIDE_TEXT("Quorvel LV-20"), kExternalLv20, WIDE_TEXT("file1.hvr"), IDS_INSTRUCTIONS_LV20},
        {WIDE_TEXT("Quorvel LV-30"), kExternalLv30, WIDE_TEXT("file1.hvr"), IDS_INSTRUCTIONS_LV30},
        {WIDE_TEXT("quorvel lv-20"), kBuiltInDriver, WIDE_TEXT("file1.lv"), IDS_INSTRUCTIONS_LV10},
        {WIDE_TEXT(""), kBuiltInDriver, WIDE_TEXT("file1.lv"), IDS_INSTRUCTIONS_LV10},
    };
    for (const auto& test : cases) {
        const ModelKind kind =
            ClassifyModel(test.model, WIDE_TEXT("Quorvel LV-20"), WIDE_TEXT("Quorvel LV-30"));
        EXPECT_EQ(test.kind, kind);
        EXPECT_EQ(test.kind != kBuiltInDriver, UsesExternalLibrary(kind));
        EXPECT_EQ(test.file, ModelFileName(kind));
        EXPECT_EQ(test.instructions, ModelInstructionTextId(kind));
    }
}
