// A library that a variant of the substitute imports, built twice with different answers: the
// copy beside the variant and a decoy, so that a test can tell which copy the loader took.
#include <cstdint>

extern "C" __declspec(dllexport) int32_t HalvekDependencyAnswer() {
    return LV_HALVEK_DEPENDENCY_ANSWER;
}
