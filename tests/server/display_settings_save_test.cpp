// The widths a view reports, written to the store as they change and not otherwise, and written
// again after a write the registry refused.
#include <windows.h>

#include <gtest/gtest.h>

#include "stations/display_settings.h"
#include "tests/server/stored_display_settings.h"
#include "tests/support/registry_override.h"

namespace {

void DeleteStored() {
    UniqueRegKey root;
    ASSERT_EQ(ERROR_SUCCESS, ::RegOpenKeyExW(HKEY_CURRENT_USER, StationRootKeyPath().c_str(), 0,
                                             KEY_SET_VALUE, root.put()));
    ASSERT_EQ(ERROR_SUCCESS, ::RegDeleteValueW(root.get(), L"Display Settings"));
}

// Widths the module starts from, whatever an earlier test left.
void StartFrom(int first, int second) {
    SetDisplayColumnWidth(0, first);
    SetDisplayColumnWidth(1, second);
}

TEST(DisplaySettingsSave, WrittenWhenAWidthChangesAndOnlyThen) {
    RegistryOverride registry;
    StartFrom(100, 100);
    const int dragged[kDisplayColumnCount] = {180, 0};
    ASSERT_EQ(S_OK, StoreDisplayColumnWidths(dragged));
    EXPECT_EQ((Bytes{180, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0}), StoredDisplaySettings());
    EXPECT_EQ(180, DisplayColumnWidth(0));
    EXPECT_EQ(0, DisplayColumnWidth(1));

    // The same widths again write nothing: the value removed behind the module's back stays away.
    DeleteStored();
    ASSERT_EQ(S_OK, StoreDisplayColumnWidths(dragged));
    EXPECT_EQ(Bytes{}, StoredDisplaySettings());

    // A change in either column writes both.
    const int second[kDisplayColumnCount] = {180, 0x1234};
    ASSERT_EQ(S_OK, StoreDisplayColumnWidths(second));
    EXPECT_EQ((Bytes{180, 0, 0, 0, 0x34, 0x12, 0, 0, 0, 0, 0, 0}), StoredDisplaySettings());
}

TEST(DisplaySettingsSave, AWriteTheRegistryRefusedIsMadeByTheNextCall) {
    RegistryOverride registry;
    StartFrom(100, 100);
    // Two hives of its own. Under the volatile one the registry refuses the settings' lasting
    // key: a volatile key has no lasting children.
    UniqueRegKey refusing, accepting;
    ASSERT_EQ(ERROR_SUCCESS,
              ::RegCreateKeyExW(HKEY_CURRENT_USER, L"Refusing", 0, nullptr, REG_OPTION_VOLATILE,
                                KEY_ALL_ACCESS, nullptr, refusing.put(), nullptr));
    ASSERT_EQ(ERROR_SUCCESS, ::RegCreateKeyExW(HKEY_CURRENT_USER, L"Accepting", 0, nullptr, 0,
                                               KEY_ALL_ACCESS, nullptr, accepting.put(), nullptr));
    ASSERT_EQ(ERROR_SUCCESS, ::RegOverridePredefKey(HKEY_CURRENT_USER, refusing.get()));

    const int dragged[kDisplayColumnCount] = {222, 0};
    EXPECT_TRUE(FAILED(StoreDisplayColumnWidths(dragged)));
    EXPECT_EQ(222, DisplayColumnWidth(0)) << "kept for the views all the same";

    ASSERT_EQ(ERROR_SUCCESS, ::RegOverridePredefKey(HKEY_CURRENT_USER, accepting.get()));
    ASSERT_EQ(S_OK, StoreDisplayColumnWidths(dragged)) << "unchanged, yet not stored yet";
    EXPECT_EQ((Bytes{222, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0}), StoredDisplaySettings());
}

}  // namespace
