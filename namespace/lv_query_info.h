// The namespace's info tip object.
#pragma once

#include <windows.h>
#include <shlobj.h>
#include <shlwapi.h>

#include "namespace/quorvel_query_info_base.h"
#include "support/com_object.h"

class CLVQueryInfo final : public ComObject<CQuorvelQueryInfoBase> {
public:
    CLVQueryInfo() noexcept = default;

    IFACEMETHODIMP QueryInterface(REFIID iid, void** object) override {
        // MinGW declares no __uuidof for this interface: the entry names its IID itself.
        static const QITAB table[] = {{&IID_IQueryInfo, OFFSETOFCLASS(IQueryInfo, CLVQueryInfo)},
                                      {}};
        return QISearch(this, table, iid, object);
    }
};
