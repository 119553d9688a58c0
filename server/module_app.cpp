// Module start-up and unload.
#include "server/module_app.h"

#include "namespace/icon_lists.h"
#include "server/class_table.h"
#include "stations/station_store.h"
#include "support/registered_messages.h"

void CModuleApp::InitInstance(HMODULE module) noexcept {
    RegisterWindowMessages();
    // Missing settings leave the default column widths: nothing to report at load time.
    (void)LoadDisplaySettings();
    // Without the lists items show no icon, but the folder still works: the load goes on.
    (void)BuildSharedIconLists(module);
}

void CModuleApp::ExitInstance(bool processTerminating) noexcept {
    // A failed save keeps the previous widths in the store: nothing more can be done on unload.
    (void)SaveDisplaySettings();
    if (processTerminating)
        return;  // the process takes its memory and handles with it; other modules may be gone
    DestroySharedIconLists();
    ReleaseClassFactories();
}
