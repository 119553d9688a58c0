// The folder's view, background menu and drop target, until their classes exist: the folder
// answers every request for them with E_NOINTERFACE. Bringing one in means replacing its line
// below with the real class's header; the folder then creates it through the set-up it already
// calls:
//   CLVShellView:   default-constructible; HRESULT SetUp(IShellFolder* folder,
//                   PCUIDLIST_RELATIVE own)
//   CLVContextMenu: default-constructible
//   CLVDropTarget:  default-constructible; HRESULT SetItem(PCUIDLIST_RELATIVE full)
#pragma once

#include "namespace/pending_shell_object.h"

class CLVShellView : public PendingShellObject {};
class CLVContextMenu : public PendingShellObject {};
class CLVDropTarget : public PendingShellObject {};
