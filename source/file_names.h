// File name rules: a file path split into directory, name and
// extension, the "$" marker replaced by a default name, and the split parts
// checked against fixed length limits and character sets. The source stack
// does not use these: it opens names exactly as it receives them.
#ifndef TPLEX_SOURCE_FILE_NAMES_H
#define TPLEX_SOURCE_FILE_NAMES_H

#include <cstdint>

namespace tplex {

inline constexpr int spec_dir_size = 200;  // dir_part: 199 characters + NUL
inline constexpr int spec_name_size = 80;  // name_part: 79 characters + NUL
// ext_part holds 15 characters + NUL: a valid extension (10) fits, and an
// overlong one cut to the field is still long enough to be refused.
inline constexpr int spec_ext_size = 16;

inline constexpr int spec_dir_max = 100;  // longest valid directory
inline constexpr int spec_name_max = 40;  // longest valid name
inline constexpr int spec_ext_max = 10;   // longest valid extension

struct file_spec {
    char dir_part[spec_dir_size];    // before the last separator; empty if none
    char name_part[spec_name_size];  // the name, without an extension split off
    char ext_part[spec_ext_size];    // the expected extension when split off
};

// Splits path (changed in place: it loses its directory) into out, splitting
// off the extension only when it equals expected_ext exactly. A part too long
// for its field is cut to the field, so file_spec_invalid still refuses it.
void split_file_spec(char *path, const char *expected_ext, file_spec *out);
// Puts name in place of a name_part that is exactly "$".
void apply_default_name(file_spec *parts, const char *name);
// 1 when a part is too long, a name is missing after a directory, or a
// character is not allowed where it stands; else 0.
std::uint8_t file_spec_invalid(const file_spec *parts);
// 1 when c may not stand in a directory, else 0.
std::uint8_t bad_dir_char(char c);
// 1 when c may not stand in a name or an extension, else 0.
std::uint8_t bad_name_char(char c);

}  // namespace tplex

#endif
