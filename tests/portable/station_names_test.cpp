// Unique names for new and pasted stations, and the characters a name may not hold.
#include <gtest/gtest.h>

#include <set>

#include "stations/portable/station_names.h"

namespace {

NameTakenPredicate TakenAmong(const std::set<WideString>& names) {
    return [names](const WideString& name) { return names.count(name) != 0; };
}

}  // namespace

TEST(StationNames, UniqueNameSkipsOneAndCountsOnFromTwo) {
    const WideString base = WIDE_TEXT("New digital level");
    EXPECT_EQ(base, MakeUniqueName(base, TakenAmong({})));
    EXPECT_EQ(base + WIDE_TEXT(" (2)"), MakeUniqueName(base, TakenAmong({base})));
    EXPECT_EQ(base + WIDE_TEXT(" (3)"),
              MakeUniqueName(base, TakenAmong({base, base + WIDE_TEXT(" (2)")})));
    // "(1)" is never produced even when it would be free.
    EXPECT_EQ(base + WIDE_TEXT(" (2)"),
              MakeUniqueName(base, TakenAmong({base, base + WIDE_TEXT(" (3)")})));
}

TEST(StationNames, UniqueNameCountsPastTen) {
    std::set<WideString> taken = {WIDE_TEXT("S")};
    for (const WideChar* number :
         {WIDE_TEXT("2"), WIDE_TEXT("3"), WIDE_TEXT("4"), WIDE_TEXT("5"), WIDE_TEXT("6"),
          WIDE_TEXT("7"), WIDE_TEXT("8"), WIDE_TEXT("9"), WIDE_TEXT("10"), WIDE_TEXT("11")})
        taken.insert(WIDE_TEXT("S (") + WideString(number) + WIDE_TEXT(")"));
    EXPECT_EQ(WIDE_TEXT("S (12)"), MakeUniqueName(WIDE_TEXT("S"), TakenAmong(taken)));
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
    EXPECT_FALSE(IsValidStationName(WIDE_TEXT("")));
    for (const WideChar* bad :
         {WIDE_TEXT("a\\b"), WIDE_TEXT("a/b"), WIDE_TEXT("\"a\""), WIDE_TEXT("a*")}) {
        EXPECT_FALSE(IsValidStationName(bad));
    }
}
