// Placeholders for the shell objects the folder creates whose classes do not exist yet.
//
// The folder view, its background menu, the data object and the drop target come with the folder
// view and transfer work. Until then the folder answers every request for them with
// E_NOINTERFACE. Bringing one of them in means replacing its placeholder below with the real
// class's header; the folder then creates it through the set-up it already calls:
//   CLVShellView:   default-constructible, HRESULT SetUp(IShellFolder* folder, PCUIDLIST_RELATIVE
//   own) CLVContextMenu: default-constructible CLVDataObject, CLVDropTarget: default-constructible,
//   HRESULT SetItem(PCUIDLIST_RELATIVE full)
#pragma once

#include <type_traits>

struct PendingShellObject {};

class CLVShellView : public PendingShellObject {};
class CLVContextMenu : public PendingShellObject {};
class CLVDataObject : public PendingShellObject {};
class CLVDropTarget : public PendingShellObject {};

template <typename T>
inline constexpr bool kIsPendingShellObject = std::is_base_of_v<PendingShellObject, T>;
