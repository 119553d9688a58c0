// The shell objects the folder creates, and placeholders for those whose classes do not exist yet.
//
// The folder view, its background menu and the drop target come with the folder view work; until
// then the folder answers every request for them with E_NOINTERFACE. Bringing one of them in
// means replacing its placeholder below with the real class's header; the folder then creates it
// through the set-up it already calls:
//   CLVShellView:   default-constructible; HRESULT SetUp(IShellFolder* folder,
//                   PCUIDLIST_RELATIVE own)
//   CLVContextMenu: default-constructible
//   CLVDropTarget:  default-constructible; HRESULT SetItem(PCUIDLIST_RELATIVE full)
// The data object (view/lv_data_object.h) is already real.
#pragma once

#include <type_traits>

#include "view/lv_data_object.h"

struct PendingShellObject {};

class CLVShellView : public PendingShellObject {};
class CLVContextMenu : public PendingShellObject {};
class CLVDropTarget : public PendingShellObject {};

template <typename T>
inline constexpr bool kIsPendingShellObject = std::is_base_of_v<PendingShellObject, T>;
