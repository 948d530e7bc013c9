// File name rules: a file path split into directory, name and
// extension, the "$" marker replaced by a default name, and the split parts
// checked against fixed length limits and character sets. The source stack
// does not use these: it opens names exactly as it receives them.
#ifndef TPLEX_SERVICES_FILE_NAMES_H
#define TPLEX_SERVICES_FILE_NAMES_H

#include <cstdint>

#include "tplex/services.h"

namespace tplex {

// The record is file_spec of tplex/services.h: dir_part holds 199
// characters + NUL, name_part 79 + NUL, ext_part 15 + NUL: a valid
// extension (10) fits, and an overlong one cut to the field is still long
// enough to be refused.
static_assert(sizeof(file_spec::dir_part) == 200 && sizeof(file_spec::name_part) == 80 &&
              sizeof(file_spec::ext_part) == 16);

inline constexpr int spec_dir_max = 100;  // longest valid directory
inline constexpr int spec_name_max = 40;  // longest valid name
inline constexpr int spec_ext_max = 10;   // longest valid extension

// split_file_spec, apply_default_name and file_spec_invalid are the C
// functions of tplex/services.h, defined in file_names.cpp.

// 1 when c may not stand in a directory, else 0.
std::uint8_t bad_dir_char(char c);
// 1 when c may not stand in a name or an extension, else 0.
std::uint8_t bad_name_char(char c);

}  // namespace tplex

#endif
