// Names of absolute item-ID lists.
#include "tools/lvexplore/item_id_list.h"

std::wstring ShellItemName(PCIDLIST_ABSOLUTE list, SIGDN kind) {
    if (!list)
        return {};
    wchar_t* name = nullptr;
    if (FAILED(::SHGetNameFromIDList(list, kind, &name)) || !name)
        return {};
    const UniqueCoTaskMem owner(name);
    return name;
}
