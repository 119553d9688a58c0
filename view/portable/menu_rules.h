// The folder's three menu groups (File, View, Edit) as data: which commands, which texts, which
// states, for a given view. The view turns them into real menu items.
#pragma once

#include <cstdint>
#include <vector>

struct MenuContext {
    uint32_t folderKind = 0;         // item kind of the view's folder: 1 the top folder, 2 a station
    bool inFileDialog = false;       // the browser offered its common-dialog interface
    bool hasSelection = false;
    bool selectionHasEntry = false;  // "Add New Digital Level" is among the selected items
    uint32_t viewMode = 1;           // 1 large icons, 2 small icons, 3 list, 4 details
};

// command 0 is a separator.
struct MenuItem {
    uint32_t command = 0;
    uint32_t textId = 0;
    bool enabled = true;
    bool isDefault = false;
    bool checked = false;  // shown as a radio mark

    bool operator==(const MenuItem&) const = default;
};

std::vector<MenuItem> FileMenuGroup(const MenuContext& context);
std::vector<MenuItem> ViewMenuGroup(const MenuContext& context);
// Empty outside the two kinds of folder.
std::vector<MenuItem> EditMenuGroup(const MenuContext& context);

// The view mode a mode command selects, 0 for any other command; and back.
uint32_t ViewModeOfCommand(uint32_t command) noexcept;
uint32_t CommandOfViewMode(uint32_t mode) noexcept;
