// The registered window messages by which worker threads and callbacks talk to windows.
#pragma once

#include <windows.h>

struct RegisteredMessages {
    UINT downloadThreadMessage;   // first: message code; second: heap text the receiver frees
    UINT downloadThreadFinished;  // 0, 0
    UINT halvekDownloadMessage;   // 0; the external library's result code
    UINT halvekUploadMessage;     // registered, never posted
    UINT globalNotify;            // 1; an item kind: views of that kind refresh
    UINT getEnumIdList;           // 0; the item enumerator or 0
};

extern RegisteredMessages g_registeredMessages;

// Registers all of them; the module calls this at start-up, tests call it themselves.
void RegisterWindowMessages() noexcept;
