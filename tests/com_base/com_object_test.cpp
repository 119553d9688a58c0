// The COM object base and the class factory: reference counts, the module lock, QueryInterface.
#include <windows.h>
#include <objidl.h>

#include <gtest/gtest.h>

#include "support/class_factory.h"
#include "support/com_object.h"

namespace {

class TwoInterfaces final : public ComObject<IPersist, IOleWindow> {
public:
    IFACEMETHODIMP QueryInterface(REFIID iid, void** object) override {
        static const QITAB table[] = {
            QITABENT(TwoInterfaces, IPersist), QITABENT(TwoInterfaces, IOleWindow), {}};
        return QISearch(this, table, iid, object);
    }
    IFACEMETHODIMP GetClassID(CLSID* id) override {
        *id = IID_IPersist;
        return S_OK;
    }
    IFACEMETHODIMP GetWindow(HWND* window) override {
        *window = nullptr;
        return E_FAIL;
    }
    IFACEMETHODIMP ContextSensitiveHelp(BOOL) override { return E_NOTIMPL; }
};

}  // namespace

TEST(ComObject, HoldsTheModuleLockForItsLifeOnly) {
    const LONG before = ModuleLockCount();
    {
        auto object = MakeComObject<TwoInterfaces>();
        EXPECT_EQ(before + 1, ModuleLockCount());
        Microsoft::WRL::ComPtr<IOleWindow> window;
        ASSERT_EQ(S_OK, object.As(&window));
        EXPECT_EQ(before + 1, ModuleLockCount()) << "a second reference is not a second lock";
    }
    EXPECT_EQ(before, ModuleLockCount());
}

TEST(ComObject, QueryInterfaceAnswersItsTableAndIUnknownWithOneIdentity) {
    auto object = MakeComObject<TwoInterfaces>();
    Microsoft::WRL::ComPtr<IUnknown> viaPersist, viaWindow;
    Microsoft::WRL::ComPtr<IPersist> persist;
    Microsoft::WRL::ComPtr<IOleWindow> window;
    ASSERT_EQ(S_OK, object.As(&persist));
    ASSERT_EQ(S_OK, object.As(&window));
    ASSERT_EQ(S_OK, persist.As(&viaPersist));
    ASSERT_EQ(S_OK, window.As(&viaWindow));
    EXPECT_EQ(viaPersist.Get(), viaWindow.Get());

    Microsoft::WRL::ComPtr<IStream> stream;
    EXPECT_EQ(E_NOINTERFACE, object.As(&stream));
    EXPECT_EQ(nullptr, stream.Get());
}

TEST(ClassFactory, CreatesRefusesAggregationAndMovesTheLockOnLockServer) {
    const LONG before = ModuleLockCount();
    auto factory = MakeComObject<ClassFactory>(&CreateComInstance<TwoInterfaces>);
    EXPECT_EQ(before, ModuleLockCount()) << "the cache's own reference must not hold the module";
    {
        Microsoft::WRL::ComPtr<IClassFactory> client = factory;
        Microsoft::WRL::ComPtr<IClassFactory> second = factory;
        EXPECT_EQ(before + 1, ModuleLockCount()) << "clients' references hold it once";
    }
    EXPECT_EQ(before, ModuleLockCount());

    Microsoft::WRL::ComPtr<IPersist> persist;
    ASSERT_EQ(S_OK, factory->CreateInstance(nullptr, IID_PPV_ARGS(&persist)));
    CLSID id{};
    EXPECT_EQ(S_OK, persist->GetClassID(&id));
    persist.Reset();

    IUnknown* object = reinterpret_cast<IUnknown*>(1);
    EXPECT_EQ(CLASS_E_NOAGGREGATION, factory->CreateInstance(factory.Get(), IID_IUnknown,
                                                             reinterpret_cast<void**>(&object)));
    EXPECT_EQ(nullptr, object);
    EXPECT_EQ(E_NOINTERFACE,
              factory->CreateInstance(nullptr, IID_IStream, reinterpret_cast<void**>(&object)));
    EXPECT_EQ(before, ModuleLockCount()) << "the refused object was deleted";

    factory->LockServer(TRUE);
    EXPECT_EQ(before + 1, ModuleLockCount());
    factory->LockServer(FALSE);
    EXPECT_EQ(before, ModuleLockCount());
}
