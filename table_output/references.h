// The upper layer of table output: the reference table, the string store
// and the state of the open table file.
#ifndef TPLEX_TABLE_OUTPUT_REFERENCES_H
#define TPLEX_TABLE_OUTPUT_REFERENCES_H

#include <cstddef>
#include <cstdint>

#include "table_output/output_stream.h"

namespace tplex {

inline constexpr std::uint32_t max_references = 50000;
inline constexpr std::size_t output_name_size = 200;  // 199 characters + NUL
inline constexpr std::uint32_t header_word = 60;
inline constexpr std::uint32_t plain_placeholder = 0xA5A5A5A5u;
inline constexpr std::uint32_t string_placeholder = 0x4B4B4B4Bu;

// One use of a reference: where its placeholder begins.
struct reloc_record {
    reloc_record *next;
    std::uint32_t offset;
};

// One reference id (id n is entry n - 1).
struct relocatable {
    reloc_record *first_use;  // uses in creation order
    reloc_record *last_use;   // so a use is appended without walking the chain
    std::uint32_t target;     // 0: not defined; an offset, or a 1-based string position
    std::uint32_t string_flag;
};

struct string_store {
    byte_chunk *first;    // null before the first OpenOutput and after FreeOutputTables
    byte_chunk *current;  // strings are appended here
    std::uint32_t total;  // bytes of all stored strings, terminators included
};

struct table_output_state {
    relocatable *relocatables;  // max_references entries, or null
    std::uint32_t id_count;     // ids handed out: 1 to id_count are valid
    string_store store;
    // An output is open from a successful OpenOutput until CloseOutput
    // succeeds or AbandonOutput; a failure that closes the file leaves it
    // open, so AbandonOutput can still delete the partial file.
    bool open;
    std::uint32_t tag;
    char name[output_name_size];  // for AbandonOutput
};

extern table_output_state table_output;

}  // namespace tplex

#endif
