// Result macros: each failure is written to the error log with its file, function and line.
#pragma once

#include <windows.h>

#include <new>

#include "support/error_log.h"

// Writes a failure at a point of this code to the error log (support/error_log.h), its source
// named by the file name alone: the build machine's folders are nobody's business. Never fails.
void LogFailure(HRESULT result, const char* file, const char* function, int line) noexcept;

// The thread's last error as an HRESULT; E_FAIL when a failed call left none, so that the
// result can never read as success.
[[nodiscard]] HRESULT LastErrorResult() noexcept;

// The HRESULT for the exception being handled (bad_alloc → E_OUTOFMEMORY, anything else E_FAIL).
[[nodiscard]] HRESULT ResultFromCaughtException() noexcept;

#define LV_LOG_AND_RETURN(result)                             \
    do {                                                      \
        const HRESULT lv_result_ = (result);                  \
        LogFailure(lv_result_, __FILE__, __func__, __LINE__); \
        return lv_result_;                                    \
    } while (0)

#define RETURN_IF_FAILED(expression)         \
    do {                                     \
        const HRESULT lv_hr_ = (expression); \
        if (FAILED(lv_hr_))                  \
            LV_LOG_AND_RETURN(lv_hr_);       \
    } while (0)

#define RETURN_HR_IF(result, condition) \
    do {                                \
        if (condition)                  \
            LV_LOG_AND_RETURN(result);  \
    } while (0)

#define RETURN_IF_NULL_ALLOC(pointer) RETURN_HR_IF(E_OUTOFMEMORY, (pointer) == nullptr)

#define RETURN_IF_WIN32_BOOL_FALSE(expression)    \
    do {                                          \
        if (!(expression))                        \
            LV_LOG_AND_RETURN(LastErrorResult()); \
    } while (0)

#define RETURN_IF_WIN32_ERROR(expression)                     \
    do {                                                      \
        const LONG lv_error_ = static_cast<LONG>(expression); \
        if (lv_error_ != ERROR_SUCCESS)                       \
            LV_LOG_AND_RETURN(HRESULT_FROM_WIN32(lv_error_)); \
    } while (0)

// Ends every COM method body that can meet an allocation failure: try { ... } CATCH_RETURN()
#define CATCH_RETURN()                                          \
    catch (...) {                                               \
        const HRESULT lv_caught_ = ResultFromCaughtException(); \
        LogFailure(lv_caught_, __FILE__, __func__, __LINE__);   \
        return lv_caught_;                                      \
    }

// Ends a body whose failure has nowhere to go (a window procedure, a destructor's clean-up): the
// failure is logged and the caller goes on.
#define CATCH_LOG()                                                            \
    catch (...) {                                                              \
        LogFailure(ResultFromCaughtException(), __FILE__, __func__, __LINE__); \
    }
