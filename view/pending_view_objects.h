// The folder's drop target, until its class exists: the folder answers every request for it with
// E_NOINTERFACE. Bringing it in means replacing the line below with the real class's header; the
// folder then creates it through the set-up it already calls:
//   CLVDropTarget:  default-constructible; HRESULT SetItem(PCUIDLIST_RELATIVE full)
#pragma once

#include "namespace/pending_shell_object.h"

class CLVDropTarget : public PendingShellObject {};
