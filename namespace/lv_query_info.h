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
        static const QITAB table[] = {QITABENT(CLVQueryInfo, IQueryInfo), {}};
        return QISearch(this, table, iid, object);
    }
};
