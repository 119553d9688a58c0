// One class factory for every creatable class, driven by a creation function.
#pragma once

#include <windows.h>
#include <unknwn.h>

#include "support/com_object.h"
#include "support/error_handling.h"

using CreateInstanceFunction = HRESULT (*)(REFIID iid, void** object);

// Creates T with its default constructor and asks it for the interface; the object is released
// again when that fails.
template <typename T>
HRESULT CreateComInstance(REFIID iid, void** object) noexcept {
    if (!object)
        return E_POINTER;
    *object = nullptr;
    try {
        return MakeComObject<T>()->QueryInterface(iid, object);
    }
    CATCH_RETURN()
}

// Factories are cached for the module's life, so they do not hold the module lock themselves;
// only LockServer moves it.
class ClassFactory final : public ComObjectImpl<false, IClassFactory> {
public:
    explicit ClassFactory(CreateInstanceFunction create) noexcept : create_(create) {}

    IFACEMETHODIMP QueryInterface(REFIID iid, void** object) override {
        static const QITAB table[] = {QITABENT(ClassFactory, IClassFactory), {}};
        return QISearch(this, table, iid, object);
    }

    IFACEMETHODIMP CreateInstance(IUnknown* outer, REFIID iid, void** object) override {
        if (!object)
            return E_POINTER;
        *object = nullptr;
        if (outer)
            return CLASS_E_NOAGGREGATION;
        return create_(iid, object);
    }

    IFACEMETHODIMP LockServer(BOOL lock) override {
        if (lock) {
            LockModule();
        } else {
            UnlockModule();
        }
        return S_OK;
    }

private:
    CreateInstanceFunction create_;
};
