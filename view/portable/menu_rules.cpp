// The folder's menu groups and their enabling rules.
#include "view/portable/menu_rules.h"

#include "res/ids_stations.h"
#include "res/ids_view.h"

namespace {

constexpr uint32_t kTopFolder = 1;
constexpr uint32_t kStationFolder = 2;

MenuItem Separator() {
    return MenuItem{};
}

MenuItem Item(uint32_t command, uint32_t textId, bool enabled) {
    MenuItem item;
    item.command = command;
    item.textId = textId;
    item.enabled = enabled;
    return item;
}

}  // namespace

std::vector<MenuItem> FileMenuGroup(const MenuContext& context) {
    std::vector<MenuItem> group;
    MenuItem open = Item(IDM_OPEN, context.inFileDialog ? IDS_SELECT : IDS_OPEN,
                         context.hasSelection);
    open.isDefault = true;
    group.push_back(open);
    if (context.folderKind == kTopFolder) {
        // Deleting or editing the entry means nothing: it is not a station.
        const bool stationsOnly = context.hasSelection && !context.selectionHasEntry;
        group.push_back(Separator());
        group.push_back(Item(IDM_CREATE_STATION, IDS_CREATE_DIGITAL_LEVEL, true));
        group.push_back(Item(IDM_DELETE, IDS_DELETE, stationsOnly));
        group.push_back(Item(IDM_PROPERTIES, IDS_PROPERTIES, stationsOnly));
    }
    return group;
}

std::vector<MenuItem> ViewMenuGroup(const MenuContext& context) {
    static constexpr uint32_t kModeTexts[] = {IDS_LARGE_ICONS, IDS_SMALL_ICONS, IDS_LIST,
                                              IDS_DETAILS};
    std::vector<MenuItem> group{Separator()};
    for (uint32_t mode = 1; mode <= 4; ++mode) {
        MenuItem item = Item(CommandOfViewMode(mode), kModeTexts[mode - 1], true);
        item.checked = mode == context.viewMode;
        group.push_back(item);
    }
    return group;
}

std::vector<MenuItem> EditMenuGroup(const MenuContext& context) {
    if (context.folderKind != kTopFolder && context.folderKind != kStationFolder)
        return {};
    // Paste works without a selection (its shortcut does), yet its item asks for one, as the
    // folder always had it.
    return {Separator(), Item(IDM_COPY, IDS_COPY, context.hasSelection),
            Item(IDM_PASTE, IDS_PASTE, context.hasSelection && !context.selectionHasEntry)};
}

uint32_t ViewModeOfCommand(uint32_t command) noexcept {
    return command >= IDM_LARGE_ICONS && command <= IDM_DETAILS ? command - IDM_LARGE_ICONS + 1
                                                                 : 0;
}

uint32_t CommandOfViewMode(uint32_t mode) noexcept {
    return mode >= 1 && mode <= 4 ? IDM_LARGE_ICONS + mode - 1 : 0;
}
