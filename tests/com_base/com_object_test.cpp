// The class factory over the COM object base: the module lock held by the factory's clients and
// by LockServer, creation, and refused objects deleted again. That objects hold the lock for
// their life is proved through the DLL's exports (server tests) and by every shell-folder test.
#include <windows.h>
#include <objidl.h>

#include <gtest/gtest.h>

#include "support/class_factory.h"
#include "support/com_object.h"

using Microsoft::WRL::ComPtr;

namespace {

class Persist final : public ComObject<IPersist> {
public:
    IFACEMETHODIMP QueryInterface(REFIID iid, void** object) override {
        static const QITAB table[] = {QITABENT(Persist, IPersist), {}};
        return QISearch(this, table, iid, object);
    }
    IFACEMETHODIMP GetClassID(CLSID* id) override {
        *id = IID_IPersist;
        return S_OK;
    }
};

}  // namespace

TEST(ClassFactory, OnlyClientsAndLockServerHoldTheModule) {
    const LONG before = ModuleLockCount();
    auto factory = MakeComObject<ClassFactory>(&CreateComInstance<Persist>);
    EXPECT_EQ(before, ModuleLockCount()) << "the cache's own reference must not hold the module";
    {
        ComPtr<IClassFactory> client = factory;
        ComPtr<IClassFactory> second = factory;
        EXPECT_EQ(before + 1, ModuleLockCount()) << "clients' references hold it once";
    }
    EXPECT_EQ(before, ModuleLockCount());

    factory->LockServer(TRUE);
    EXPECT_EQ(before + 1, ModuleLockCount());
    factory->LockServer(FALSE);
    EXPECT_EQ(before, ModuleLockCount());
}

TEST(ClassFactory, CreatesAndReleasesWhatItRefuses) {
    const LONG before = ModuleLockCount();
    auto factory = MakeComObject<ClassFactory>(&CreateComInstance<Persist>);
    ComPtr<IPersist> persist;
    ASSERT_EQ(S_OK, factory->CreateInstance(nullptr, IID_PPV_ARGS(&persist)));
    CLSID id{};
    EXPECT_EQ(S_OK, persist->GetClassID(&id));
    persist.Reset();

    void* object = reinterpret_cast<void*>(1);
    EXPECT_EQ(CLASS_E_NOAGGREGATION, factory->CreateInstance(factory.Get(), IID_IUnknown, &object));
    EXPECT_EQ(nullptr, object);
    EXPECT_EQ(E_NOINTERFACE, factory->CreateInstance(nullptr, IID_IStream, &object));
    EXPECT_EQ(nullptr, object);
    EXPECT_EQ(before, ModuleLockCount()) << "the refused object was deleted";
}
