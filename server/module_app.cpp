// Module start-up and unload.
#include "server/module_app.h"

#include "namespace/icon_lists.h"
#include "server/class_table.h"
#include "stations/display_settings.h"
#include "support/registered_messages.h"

namespace {

INIT_ONCE g_startUp = INIT_ONCE_STATIC_INIT;
bool g_started = false;  // written once inside the one-time initialisation

BOOL CALLBACK StartUp(INIT_ONCE*, void* module, void**) {
    RegisterWindowMessages();
    // Missing settings leave the default column widths: nothing to report at start-up.
    (void)LoadDisplaySettings();
    // Without the lists items show no icon, but the folder still works: start-up goes on.
    (void)BuildSharedIconLists(static_cast<HMODULE>(module));
    g_started = true;
    return TRUE;
}

}  // namespace

void CModuleApp::EnsureStarted(HMODULE module) noexcept {
    // StartUp never fails, so the call cannot either.
    (void)::InitOnceExecuteOnce(&g_startUp, &StartUp, module, nullptr);
}

void CModuleApp::ExitInstance() noexcept {
    if (g_started) {
        // A failed save keeps the previous widths in the store: nothing more can be done here.
        (void)SaveDisplaySettings();
    }
    DestroySharedIconLists();
    ReleaseClassFactories();
}
