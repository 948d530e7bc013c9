// libFuzzer entry of the table_output target.
#include <cstddef>
#include <cstdint>

#include "harness_support.h"
#include "table_harness.h"

extern "C" int LLVMFuzzerInitialize(int *, char ***) {
    tplex::fuzz::silence_stdio();
    return 0;
}

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size) {
    tplex::fuzz::run_table_output(data, size);
    return 0;
}
