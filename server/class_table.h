// The module's creatable classes as data, and the one cached class factory of each.
#pragma once

#include <windows.h>
#include <unknwn.h>

#include <span>

#include "support/class_factory.h"

struct ClassTableEntry {
    const CLSID* classId;
    UINT registryScriptId;  // the "REGISTRY" resource that registers the class
    // Null while the class is registered but its implementation is not part of the module yet:
    // such a class is not available through DllGetClassObject.
    CreateInstanceFunction create;
};

// In registration order; the context-menu class is not in it (its script is never run).
std::span<const ClassTableEntry> ClassTable() noexcept;

// DllGetClassObject: the class's factory (made on first request, then cached until the module
// tears down) asked for the interface; CLASS_E_CLASSNOTAVAILABLE for a class not in the table.
[[nodiscard]] HRESULT GetClassObject(REFCLSID classId, REFIID iid, void** object) noexcept;

// Releases the cached factories, made again on the next request. Only while no client holds a
// factory and no GetClassObject runs: the module's tear-down, when DllCanUnloadNow answers S_OK.
void ReleaseClassFactories() noexcept;
