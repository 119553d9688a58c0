// Registration of the module's window messages by their fixed texts.
#include "support/registered_messages.h"

RegisteredMessages g_registeredMessages{};

void RegisterWindowMessages() noexcept {
    g_registeredMessages.downloadThreadMessage = ::RegisterWindowMessageW(
        L"Quorvel Digital Level Shell Extension - Download Thread Message");
    g_registeredMessages.downloadThreadFinished = ::RegisterWindowMessageW(
        L"Quorvel Digital Level Shell Extension - Download Thread Finished");
    g_registeredMessages.halvekDownloadMessage =
        ::RegisterWindowMessageW(L"Halvek Total Stations Shell Extension - Download Message");
    g_registeredMessages.halvekUploadMessage =
        ::RegisterWindowMessageW(L"Halvek Total Stations Shell Extension - Upload Message");
    g_registeredMessages.globalNotify =
        ::RegisterWindowMessageW(L"LVShell Extension - Global Notify");
    g_registeredMessages.getEnumIdList =
        ::RegisterWindowMessageW(L"QRV Net Shell Extension - Get EnumIDList");
}
