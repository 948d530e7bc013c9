// The file name rules harness. Input: a file path, byte 0x1E, an expected
// extension, byte 0x1E, a default name. The path is split, the marker
// replaced and the result validated; every part must fit its field, and a
// path found valid must keep to the limits and character sets.
#ifndef TPLEX_FUZZ_FILE_NAMES_HARNESS_H
#define TPLEX_FUZZ_FILE_NAMES_HARNESS_H

#include <cstddef>
#include <cstdint>

namespace tplex::fuzz {

void run_file_names(const std::uint8_t *data, std::size_t size);

}  // namespace tplex::fuzz

#endif
