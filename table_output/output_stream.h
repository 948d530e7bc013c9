// The table output byte stream: its switches, its sinks (raw file, hex text
// file, memory chunks), the output offset and the block stack. The writers
// themselves are the C operations of tplex/table_output.h.
#ifndef TPLEX_TABLE_OUTPUT_OUTPUT_STREAM_H
#define TPLEX_TABLE_OUTPUT_OUTPUT_STREAM_H

#include <cstdint>
#include <cstdio>

#include "base/compiler.h"
#include "tplex/table_output.h"

namespace tplex {

inline constexpr std::uint32_t chunk_size = 10000;  // data bytes of a byte_chunk
inline constexpr std::uint32_t block_stack_size = 100;
inline constexpr std::uint8_t fill_byte = 0x3C;  // alignment and block fill

// A link of the string store or of memory output. Chunks are appended,
// never moved or reallocated.
struct byte_chunk {
    byte_chunk *link;  // next chunk, null in the last one
    std::uint32_t used;
    std::uint8_t data[chunk_size];
};

struct output_stream_state {
    // The table file; null when none is open or a failure has closed it, so
    // nothing can reach a closed file.
    std::FILE *file;
    // Bytes written since the stream began (OpenOutput or StartMemoryOutput):
    // the offset of the next byte.
    std::uint32_t offset;
    // Switches from OpenOutput's flags.
    bool align;
    bool hex_text;
    bool drop_newlines;
    bool diagnostics;
    bool literal_backslash;
    // Memory output: on, its chain and its total.
    bool memory;
    byte_chunk *memory_first;
    byte_chunk *memory_current;
    std::uint32_t memory_total;
    // Starting offsets of the open blocks.
    std::uint32_t block_start[block_stack_size];
    std::uint32_t block_depth;
};

extern output_stream_state output_stream;

// Sets the five switches of OpenOutput's flags word.
void set_output_switches(std::uint32_t flags);
// Starts a new byte stream at offset 0; open blocks stay open.
void begin_stream();
// Prints a failure message on standard error when diagnostics are on.
void report(const char *format, ...) TPLEX_PRINTF_FORMAT(1, 2);
// Closes the table file, if still open; later bytes then fail to reach it.
void close_output_file();
// Closes the file, reports the write failure, returns TPLEX_OUT_WRITE_FAILED.
status_code fail_write();
// Writes fill bytes until the offset is a multiple of boundary.
status_code fill_to(std::uint32_t boundary, std::uint8_t fill = fill_byte);
// A new empty chunk from mem_alloc, or null.
byte_chunk *new_chunk();
// Releases a chain of chunks from its first.
void release_chunks(byte_chunk *first);

}  // namespace tplex

#endif
