// IUnknown written once: an interlocked reference count and the module lock. Each class answers
// QueryInterface from its own QITAB table through QISearch.
//
//   class CThing final : public ComObject<IThing, IOther> {
//   public:
//       IFACEMETHODIMP QueryInterface(REFIID iid, void** object) override {
//           static const QITAB table[] = {QITABENT(CThing, IThing), QITABENT(CThing, IOther), {}};
//           return QISearch(this, table, iid, object);
//       }
//       ...
//   };
//   Microsoft::WRL::ComPtr<CThing> thing = MakeComObject<CThing>(...);  // may throw bad_alloc
#pragma once

#include <windows.h>
#include <shlwapi.h>
#include <wrl/client.h>

#include <new>
#include <utility>

#include "support/module_lock.h"

template <bool HoldsModuleLock, typename... Bases>
class ComObjectImpl : public Bases... {
public:
    ComObjectImpl(const ComObjectImpl&) = delete;
    ComObjectImpl& operator=(const ComObjectImpl&) = delete;

    IFACEMETHODIMP_(ULONG) AddRef() override {
        return static_cast<ULONG>(::InterlockedIncrement(&referenceCount_));
    }

    IFACEMETHODIMP_(ULONG) Release() override {
        const LONG count = ::InterlockedDecrement(&referenceCount_);
        if (count == 0)
            delete this;
        return static_cast<ULONG>(count);
    }

protected:
    // Objects are born with one reference, owned by whoever created them.
    ComObjectImpl() noexcept {
        if constexpr (HoldsModuleLock)
            LockModule();
    }
    virtual ~ComObjectImpl() {
        if constexpr (HoldsModuleLock)
            UnlockModule();
    }

private:
    LONG referenceCount_ = 1;
};

// Every object of the namespace holds one module lock for its life.
template <typename... Bases>
using ComObject = ComObjectImpl<true, Bases...>;

// Creates an object and takes over its first reference.
template <typename T, typename... Arguments>
Microsoft::WRL::ComPtr<T> MakeComObject(Arguments&&... arguments) {
    Microsoft::WRL::ComPtr<T> object;
    // MinGW's ComPtr::Attach adds a reference, unlike the platform's: store the pointer directly.
    *object.GetAddressOf() = new T(std::forward<Arguments>(arguments)...);
    return object;
}
