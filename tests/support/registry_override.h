// Redirects HKEY_CURRENT_USER (and, on request, HKEY_LOCAL_MACHINE) to scratch keys for one test,
// so that tests neither see each other's stations nor depend on the order they run in.
#pragma once

#include <windows.h>

#include <string>
#include <vector>

#include "support/unique_resource.h"

class RegistryOverride {
public:
    enum class Hives { CurrentUser, CurrentUserAndLocalMachine };

    explicit RegistryOverride(Hives hives = Hives::CurrentUser);
    RegistryOverride(const RegistryOverride&) = delete;
    RegistryOverride& operator=(const RegistryOverride&) = delete;
    ~RegistryOverride();

    // Writes HARDWARE\DEVICEMAP\SERIALCOMM of the overridden local-machine hive with these ports.
    void SetSerialPorts(const std::vector<std::wstring>& ports);

private:
    std::wstring scratchPath_;
    UniqueRegKey currentUser_;
    UniqueRegKey localMachine_;
};
