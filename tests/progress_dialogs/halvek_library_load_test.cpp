// The external library's own dependencies: looked for beside it and in the system's folders,
// never in the current directory, where a decoy of the dependency (another answer) lies.
#include <windows.h>

#include <gtest/gtest.h>

#include <cstdint>
#include <filesystem>
#include <string>

#include "download/halvek_comm.h"

namespace {

namespace fs = std::filesystem;

// The build tree's folder as Wine sees it: on drive Z:, which maps the host's root.
fs::path BuiltFolder() {
    const std::string host = LV_HALVEK_DEPENDENCY_DIR;
    std::wstring path = host.front() == '/' ? L"Z:" : L"";
    for (char c : host)
        path.push_back(c == '/' ? L'\\' : static_cast<wchar_t>(c));
    return path;
}

class CurrentDirectory {
public:
    explicit CurrentDirectory(const fs::path& folder) {
        ::GetCurrentDirectoryW(MAX_PATH, before_);
        EXPECT_TRUE(::SetCurrentDirectoryW(folder.c_str())) << folder;
    }
    ~CurrentDirectory() { ::SetCurrentDirectoryW(before_); }

private:
    wchar_t before_[MAX_PATH] = {};
};

using AnswerFunction = int32_t (*)();

}  // namespace

TEST(HalvekLibraryLoad, DependenciesComeFromBesideTheLibraryNeverFromTheCurrentDirectory) {
    const fs::path built = BuiltFolder();
    const fs::path beside = built / L"beside";
    ASSERT_TRUE(fs::exists(beside / L"lv_halvek_dependency.dll"));
    ASSERT_TRUE(fs::exists(built / L"decoy" / L"lv_halvek_dependency.dll"));
    // The same library alone in a folder, without its dependency.
    const fs::path alone = fs::temp_directory_path() /
                           (L"lv_" + std::to_wstring(::GetCurrentProcessId()) + L"_halvek_alone");
    fs::create_directories(alone);
    fs::copy_file(beside / L"HalvekComm.dll", alone / L"HalvekComm.dll",
                  fs::copy_options::overwrite_existing);
    const CurrentDirectory decoyIsHere(built / L"decoy");

    // Alone, it does not load, although a file of its dependency's name is in the current
    // directory; the decoy is not taken.
    UniqueHalvekObject object;
    std::wstring errorText;
    EXPECT_EQ(HRESULT_FROM_WIN32(ERROR_MOD_NOT_FOUND),
              CreateHalvekObjectFrom((alone / L"HalvekComm.dll").wstring(), object, errorText));
    EXPECT_FALSE(object);
    EXPECT_FALSE(errorText.empty());
    EXPECT_EQ(nullptr, ::GetModuleHandleW(L"lv_halvek_dependency.dll"));

    // With its dependency beside it, that one is taken.
    ASSERT_EQ(S_OK,
              CreateHalvekObjectFrom((beside / L"HalvekComm.dll").wstring(), object, errorText))
        << errorText;
    EXPECT_TRUE(object);
    const HMODULE dependency = ::GetModuleHandleW(L"lv_halvek_dependency.dll");
    ASSERT_NE(nullptr, dependency);
    const auto answer = reinterpret_cast<AnswerFunction>(
        reinterpret_cast<void*>(::GetProcAddress(dependency, "HalvekDependencyAnswer")));
    ASSERT_NE(nullptr, answer);
    EXPECT_EQ(42, answer()) << "the decoy answers 7";
    wchar_t loadedFrom[MAX_PATH] = {};
    ::GetModuleFileNameW(dependency, loadedFrom, MAX_PATH);
    EXPECT_TRUE(fs::equivalent(beside / L"lv_halvek_dependency.dll", loadedFrom)) << loadedFrom;

    object.reset();
    std::error_code ignored;
    fs::remove_all(alone, ignored);
}
