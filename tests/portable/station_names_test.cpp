// Unique names for new and pasted stations, the characters a name may not hold, and what a
// station's model decides.
#include <gtest/gtest.h>

#include <set>
#include <string>

#include "res/ids_stations.h"
#include "stations/portable/model_rules.h"
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

TEST(StationNames, NamesMustBeNonEmptyWithoutPathOrWildcardCharacters) {
    EXPECT_TRUE(IsValidStationName(WIDE_TEXT("Level 3 (north)")));
    for (const WideChar* bad : {WIDE_TEXT(""), WIDE_TEXT("a\\b"), WIDE_TEXT("a/b"),
                                WIDE_TEXT("\"a\""), WIDE_TEXT("a*")}) {
        EXPECT_FALSE(IsValidStationName(bad));
    }
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
