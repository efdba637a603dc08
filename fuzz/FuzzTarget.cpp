#include "fuzz/Bodies/FuzzBodies.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* bytes, size_t size) {
    QELVAR_FUZZ_BODY(bytes, size);
    return 0;
}
