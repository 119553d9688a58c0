// Module start-up and tear-down, both outside DllMain.
#include "server/module_app.h"

#include "namespace/icon_lists.h"
#include "server/class_table.h"
#include "stations/display_settings.h"
#include "support/module_lock.h"
#include "support/registered_messages.h"

// DllGetClassObject and DllCanUnloadNow may run at the same time on two threads. Start-up and
// tear-down both run under one lock, and so does the step that takes the module lock count from
// 0 to 1: EnsureStarted takes its StartedScope's module lock before it lets go. Every other
// LockModule is made by a holder of a lock already (an object making another object, a client
// adding a reference to a factory it has, LockServer), so while CanUnloadNow holds the lock and
// reads 0, the count stays 0: no object, no client and no caller of EnsureStarted can then be
// using the icon lists or the cached factories, and they can go. The other way round, a
// DllGetClassObject that starts after a tear-down finds the module not started and starts it
// again, and a caller between EnsureStarted and its factory's own lock is covered by its scope.
namespace {

SRWLOCK g_lifecycleLock = SRWLOCK_INIT;
bool g_started = false;  // guarded by g_lifecycleLock

class ExclusiveLock {
public:
    explicit ExclusiveLock(SRWLOCK& lock) noexcept : lock_(lock) {
        ::AcquireSRWLockExclusive(&lock_);
    }
    ExclusiveLock(const ExclusiveLock&) = delete;
    ExclusiveLock& operator=(const ExclusiveLock&) = delete;
    ~ExclusiveLock() { ::ReleaseSRWLockExclusive(&lock_); }

private:
    SRWLOCK& lock_;
};

void StartUp(HMODULE module) noexcept {
    // Registering the same names again after a tear-down returns the same message numbers.
    RegisterWindowMessages();
    // Missing settings leave the default column widths: nothing to report at start-up.
    (void)LoadDisplaySettings();
    // Without the lists items show no icon, but the folder still works: start-up goes on.
    (void)BuildSharedIconLists(module);
}

}  // namespace

CModuleApp::StartedScope::~StartedScope() {
    UnlockModule();
}

CModuleApp::StartedScope CModuleApp::EnsureStarted(HMODULE module) noexcept {
    ExclusiveLock guard(g_lifecycleLock);
    if (!g_started) {
        StartUp(module);
        g_started = true;
    }
    LockModule();  // released by the scope's destructor
    return StartedScope{};
}

HRESULT CModuleApp::CanUnloadNow() noexcept {
    ExclusiveLock guard(g_lifecycleLock);
    if (ModuleLockCount() != 0)
        return S_FALSE;
    // Both are no-ops when nothing was made.
    DestroySharedIconLists();
    ReleaseClassFactories();
    g_started = false;
    return S_OK;
}
