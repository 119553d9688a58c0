// UniqueResource through counting traits, and the result macros' conversions.
#include <gtest/gtest.h>

#include <stdexcept>
#include <vector>

#include "support/error_handling.h"
#include "support/unique_resource.h"

namespace {

std::vector<int> g_closed;

struct CountingTraits {
    using Type = int;
    static Type Invalid() noexcept { return 0; }
    static void Close(Type value) noexcept { g_closed.push_back(value); }
};
using UniqueCounted = UniqueResource<CountingTraits>;

HRESULT PassFailure(HRESULT result) {
    RETURN_IF_FAILED(result);
    return S_OK;
}
HRESULT PassLastError(BOOL succeeded, DWORD error) {
    ::SetLastError(error);
    RETURN_IF_WIN32_BOOL_FALSE(succeeded);
    return S_OK;
}
HRESULT PassRegistryError(LONG status) {
    RETURN_IF_WIN32_ERROR(status);
    return S_OK;
}
template <typename Exception>
HRESULT Throw(const Exception& exception) {
    try {
        throw exception;
    }
    CATCH_RETURN()
}

}  // namespace

TEST(UniqueResource, FreesExactlyOnceWhateverTheOwnershipPath) {
    g_closed.clear();
    {
        UniqueCounted first(1);
        first.reset(2);  // frees 1
        UniqueCounted moved(std::move(first));
        EXPECT_FALSE(first);
        int* slot = moved.put();  // frees 2 before handing out the slot
        *slot = 3;
        UniqueCounted assigned(4);
        assigned = std::move(moved);  // frees 4, takes 3
        UniqueCounted released(5);
        EXPECT_EQ(5, released.release());
        EXPECT_FALSE(released);
        EXPECT_EQ(3, assigned.get());
    }  // frees 3
    EXPECT_EQ((std::vector<int>{1, 2, 4, 3}), g_closed) << "5 was released, so never freed";
}

TEST(ResultMacros, FailuresLeaveAsHresultsAndSuccessesPassThrough) {
    EXPECT_EQ(E_ACCESSDENIED, PassFailure(E_ACCESSDENIED));
    EXPECT_EQ(S_OK, PassFailure(S_FALSE)) << "S_FALSE is a success";
    EXPECT_EQ(HRESULT_FROM_WIN32(ERROR_FILE_NOT_FOUND), PassLastError(FALSE, ERROR_FILE_NOT_FOUND));
    EXPECT_EQ(S_OK, PassLastError(TRUE, ERROR_FILE_NOT_FOUND));
    EXPECT_EQ(E_FAIL, PassLastError(FALSE, ERROR_SUCCESS)) << "a failure without an error code";
    EXPECT_EQ(HRESULT_FROM_WIN32(ERROR_ACCESS_DENIED), PassRegistryError(ERROR_ACCESS_DENIED));
    EXPECT_EQ(S_OK, PassRegistryError(ERROR_SUCCESS));
    EXPECT_EQ(E_OUTOFMEMORY, Throw(std::bad_alloc()));
    EXPECT_EQ(E_FAIL, Throw(std::runtime_error("thrown")));
}
