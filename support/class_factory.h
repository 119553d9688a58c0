// One class factory for every creatable class, driven by a creation function.
#pragma once

#include <windows.h>
#include <unknwn.h>

#include "support/com_object.h"
#include "support/error_handling.h"

using CreateInstanceFunction = HRESULT (*)(REFIID iid, void** object);

// Makes an object with make() and asks it for the interface; the object is released again when
// that fails.
template <typename Make>
[[nodiscard]] HRESULT CreateAndQuery(Make make, REFIID iid, void** object) noexcept {
    if (!object)
        return E_POINTER;
    *object = nullptr;
    try {
        return make()->QueryInterface(iid, object);
    }
    CATCH_RETURN()
}

// Creates T with its default constructor.
template <typename T>
[[nodiscard]] HRESULT CreateComInstance(REFIID iid, void** object) noexcept {
    return CreateAndQuery([] { return MakeComObject<T>(); }, iid, object);
}

// Creates T from the one argument that MakeArgument() gives: what the class must be handed.
template <typename T, auto MakeArgument>
[[nodiscard]] HRESULT CreateComInstanceWith(REFIID iid, void** object) noexcept {
    return CreateAndQuery([] { return MakeComObject<T>(MakeArgument()); }, iid, object);
}

// Factories are cached until the module's tear-down (when DllCanUnloadNow answers S_OK), with one
// reference of the cache's own. That reference does not hold the module (or it could never
// unload); every reference beyond it is a client's, and while any is held the module stays
// loaded, so that a client may keep a factory without LockServer and still call it.
class ClassFactory final : public ComObjectImpl<false, IClassFactory> {
public:
    explicit ClassFactory(CreateInstanceFunction create) noexcept : create_(create) {}

    IFACEMETHODIMP_(ULONG) AddRef() override {
        const ULONG count = ComObjectImpl::AddRef();
        if (count == kCacheReferences + 1)
            LockModule();  // the first client reference
        return count;
    }

    IFACEMETHODIMP_(ULONG) Release() override {
        const ULONG count = ComObjectImpl::Release();  // may have deleted this: members are gone
        if (count == kCacheReferences)
            UnlockModule();  // the last client reference
        return count;
    }

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
    static constexpr ULONG kCacheReferences = 1;

    CreateInstanceFunction create_;
};
