// libFuzzer entry of the lexer target.
#include <cstddef>
#include <cstdint>

#include "harness_support.h"
#include "lexer_harness.h"

extern "C" int LLVMFuzzerInitialize(int *, char ***) {
    tplex::fuzz::silence_stdio();
    return 0;
}

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size) {
    tplex::fuzz::run_lexer(data, size);
    return 0;
}
