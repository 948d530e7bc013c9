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
struct RelocRecord {
    RelocRecord *next;
    std::uint32_t offset;
};

// One reference id (id n is entry n - 1).
struct Relocatable {
    RelocRecord *first_use;  // uses in creation order
    RelocRecord *last_use;   // so a use is appended without walking the chain
    std::uint32_t target;    // 0: not defined; an offset, or a 1-based string position
    std::uint32_t string_flag;
};

struct StringStore {
    ByteChunk *first;     // null before the first OpenOutput and after FreeOutputTables
    ByteChunk *current;   // strings are appended here
    std::uint32_t total;  // bytes of all stored strings, terminators included
};

struct TableOutput {
    Relocatable *relocatables;  // max_references entries, or null
    std::uint32_t id_count;     // ids handed out: 1 to id_count are valid
    StringStore store;
    // An output is open from a successful OpenOutput until CloseOutput
    // succeeds or AbandonOutput; a failure that closes the file leaves it
    // open, so AbandonOutput can still delete the partial file.
    bool open;
    std::uint32_t tag;
    char name[output_name_size];  // for AbandonOutput
};

extern TableOutput table_output;

}  // namespace tplex

#endif
