// The module's two shared image lists, built at start-up and read by the extractor and the view.
#include "namespace/icon_lists.h"

#include "res/resource.h"
#include "support/unique_resource.h"

namespace {

struct SharedIconLists {
    UniqueHImageList small;
    UniqueHImageList large;
};

// Never destroyed: the module's static destructors run in DllMain, under the loader lock, where
// no image-list call may be made. DestroySharedIconLists is the one place the lists go.
union NeverDestroyed {
    NeverDestroyed() : lists() {}
    ~NeverDestroyed() {}  // leaves the lists alone on purpose
    SharedIconLists lists;
};

NeverDestroyed g_storage;
UniqueHImageList& g_smallIcons = g_storage.lists.small;
UniqueHImageList& g_largeIcons = g_storage.lists.large;

// In index order: station, root, file.
constexpr int kListedIcons[] = {IDI_STATION, IDI_ROOT, IDI_FILE};

UniqueHImageList BuildIconList(HMODULE module, int width, int height) {
    UniqueHImageList list(::ImageList_Create(width, height, ILC_COLOR32, 4, 0));
    if (!list)
        return {};
    for (const int id : kListedIcons) {
        UniqueHIcon icon(static_cast<HICON>(::LoadImageW(module, MAKEINTRESOURCEW(id), IMAGE_ICON,
                                                         width, height, LR_CREATEDIBSECTION)));
        if (!icon || ::ImageList_AddIcon(list.get(), icon.get()) < 0)
            return {};
    }
    return list;
}

}  // namespace

bool BuildSharedIconLists(HMODULE module) {
    DestroySharedIconLists();
    g_smallIcons =
        BuildIconList(module, ::GetSystemMetrics(SM_CXSMICON), ::GetSystemMetrics(SM_CYSMICON));
    g_largeIcons =
        BuildIconList(module, ::GetSystemMetrics(SM_CXICON), ::GetSystemMetrics(SM_CYICON));
    if (g_smallIcons && g_largeIcons)
        return true;
    DestroySharedIconLists();
    return false;
}

void DestroySharedIconLists() {
    g_smallIcons.reset();
    g_largeIcons.reset();
}

HIMAGELIST SmallIconList() noexcept {
    return g_smallIcons.get();
}

HIMAGELIST LargeIconList() noexcept {
    return g_largeIcons.get();
}
