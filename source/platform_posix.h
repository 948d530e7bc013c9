// The platform layer's state on a POSIX host: a read block per open
// stream, in static storage, so opening a file allocates nothing. Only
// platform_posix.cpp uses it.
#ifndef TPLEX_SOURCE_PLATFORM_POSIX_H
#define TPLEX_SOURCE_PLATFORM_POSIX_H

#include <cstddef>
#include <cstdio>

#include "source/platform.h"

namespace tplex::platform {

inline constexpr std::size_t read_block_size = std::size_t{32} * 1024;
// 19 files can be open on the source stack at once; the rest is headroom
// for callers that open streams of their own through this layer.
inline constexpr int stream_slot_count = 24;
inline constexpr unsigned char end_mark = 0x1A;  // ends a file read in text mode

struct stream_state {
    std::FILE *file;      // null while the slot is free
    std::size_t pos;      // next byte of block to deliver
    std::size_t end;      // bytes of block that may be delivered
    std::size_t next_cr;  // first CR at or after pos, or end when there is none
    bool at_end;          // the file has nothing more to give: end, read error or 0x1A
    unsigned char block[read_block_size];
};

// The read state of every open stream, and the slot used last (a file is
// read line after line, so it is nearly always the one asked for next).
struct stream_table {
    stream_state slots[stream_slot_count];
    int last_used;
};

extern stream_table streams;

}  // namespace tplex::platform

#endif
