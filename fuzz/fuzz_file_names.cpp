// libFuzzer entry of the file_names target.
#include <cstddef>
#include <cstdint>

#include "file_names_harness.h"
#include "harness_support.h"

extern "C" int LLVMFuzzerInitialize(int *, char ***) {
    tplex::fuzz::silence_stdio();
    return 0;
}

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size) {
    tplex::fuzz::run_file_names(data, size);
    return 0;
}
