// A reader for table files, raw or hex text: checks the framing, walks the
// relocation entries and prints a summary. Never reads past the data it is
// given; a malformed file is an error message, not a crash.
#ifndef TPLEX_TABLE_OUTPUT_TABLE_CHECK_H
#define TPLEX_TABLE_OUTPUT_TABLE_CHECK_H

#include <cstddef>
#include <cstdint>
#include <cstdio>

namespace tplex {

struct TableRelocation {
    std::uint32_t location;  // offset of the placeholder
    std::uint32_t target;    // offset it stands for
    bool is_string;          // placeholder 0x4B4B4B4B: the target starts a string
};

// What check_table found. `table` points at the table's bytes: into the
// data given when it was raw, into `decoded` (owned, from mem_alloc) when it
// was hex text. Release with release_table_check.
struct TableCheck {
    const std::uint8_t *table;
    std::uint32_t size;
    bool hex_text;
    std::uint8_t *decoded;
    std::uint32_t tag;
    std::uint32_t length;             // header word at 4
    std::uint32_t relocation_offset;  // R, header word at 8
    std::uint32_t header_word;        // word at 12, 60 in a sound file
    std::uint32_t relocation_count;
    std::uint32_t string_offset;  // S: first referenced string, or R without strings
    std::uint32_t string_count;   // string references
    char error[160];              // empty when the table is sound
};

// Checks the bytes of a table file (hex text is detected and decoded).
// Returns true for a sound table; otherwise result.error says why. Either
// way the result must be released.
bool check_table(const std::uint8_t *data, std::size_t size, TableCheck &result);
void release_table_check(TableCheck &result);

// Entry `index` (below relocation_count) of a checked table.
TableRelocation table_relocation(const TableCheck &check, std::uint32_t index);
// The NUL-terminated string at `offset` of a sound table (a string target).
const char *table_string(const TableCheck &check, std::uint32_t offset);

// Prints the summary of a sound table: header, body, strings, relocations.
void print_table_summary(const TableCheck &check, std::FILE *out);

// `tplex table FILE`: reads and checks a table file; prints the summary on
// out and returns 0 when it is sound, else prints why on err and returns 1.
int inspect_table_file(const char *path, std::FILE *out, std::FILE *err);

}  // namespace tplex

#endif
