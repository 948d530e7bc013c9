// The platform layer on a POSIX host: Windows text-mode reading emulated
// over large blocks.
//
// Each stream opened here has a slot with a 32 KiB block of raw bytes (a
// nested include costs that much memory, and no more is needed to read at
// full speed). A
// line is copied out of the block in runs (memchr finds the line feed,
// memcpy moves the run); carriage returns and the 0x1A end mark are found
// with memchr as well, once per block and once after each carriage return,
// so every byte is looked at a small constant number of times. The slots
// live in static storage: opening a file allocates nothing.
#include "source/platform_posix.h"

#include <sys/stat.h>

#include <cstring>

#include "base/limits.h"

namespace tplex::platform {

stream_table streams;

namespace {

stream_state *find_slot(std::FILE *file) {
    if (streams.slots[streams.last_used].file == file) return &streams.slots[streams.last_used];
    for (int i = 0; i < stream_slot_count; ++i) {
        if (streams.slots[i].file == file) {
            streams.last_used = i;
            return &streams.slots[i];
        }
    }
    return nullptr;
}

void find_next_cr(stream_state &s) {
    const void *cr = std::memchr(s.block + s.pos, '\r', s.end - s.pos);
    s.next_cr = cr != nullptr
                    ? static_cast<std::size_t>(static_cast<const unsigned char *>(cr) - s.block)
                    : s.end;
}

// Moves the undelivered bytes (at most a CR waiting for its successor) to the
// front of the block and reads the next block behind them. Everything from a
// 0x1A on is cut off, and the stream is then at its end for good.
void refill(stream_state &s) {
    const std::size_t keep = s.end - s.pos;
    if (keep > 0) std::memmove(s.block, s.block + s.pos, keep);
    s.pos = 0;
    s.end = keep;
    if (!s.at_end) {
        std::size_t got = std::fread(s.block + keep, 1, read_block_size - keep, s.file);
        if (got == 0) s.at_end = true;  // a read error counts as the end of the file
        const void *mark = std::memchr(s.block + keep, end_mark, got);
        if (mark != nullptr) {
            got = static_cast<std::size_t>(static_cast<const unsigned char *>(mark) -
                                           (s.block + keep));
            s.at_end = true;
        }
        s.end = keep + got;
    }
    find_next_cr(s);
}

// The same translation a byte at a time, for a stream that was not opened
// by open_source and so has no slot. A 0x1A is pushed back, so every later
// read stops at it again.
bool read_line_unbuffered(std::FILE *file, char *line, std::size_t capacity) {
    std::size_t out = 0;
    while (out < capacity - 1) {
        int c = std::getc(file);
        if (c == EOF) break;
        if (c == end_mark) {
            std::ungetc(c, file);
            break;
        }
        if (c == '\r') {
            int next = std::getc(file);
            if (next == '\n') {
                c = '\n';
            } else if (next != EOF) {
                std::ungetc(next, file);
            }
        }
        line[out++] = static_cast<char>(c);
        if (c == '\n') break;
    }
    if (out == 0) return false;
    line[out] = '\0';
    return true;
}

}  // namespace

// The path is turned into a local copy with forward slashes; a path too long
// for that copy is refused rather than cut. A directory is refused too, as
// Windows refuses it: fopen on a POSIX host would open it and then fail to
// read, so an include search would stop at a directory of the file's name.
std::FILE *open_source(const char *path) {
    if (path == nullptr) return nullptr;
    char local[join_buffer_size];
    std::size_t i = 0;
    for (; path[i] != '\0'; ++i) {
        if (i == sizeof local - 1) return nullptr;
        local[i] = path[i] == '\\' ? '/' : path[i];
    }
    local[i] = '\0';

    std::FILE *file = std::fopen(local, "r");
    if (file == nullptr) return nullptr;
    // A slot that still names this stream belongs to a stream closed without
    // close_source, whose address the C library has handed out again: its
    // bytes are not this file's.
    if (stream_state *stale = find_slot(file)) stale->file = nullptr;
    stream_state *slot = find_slot(nullptr);  // none free: the open fails cleanly
    struct stat info;
    if (slot == nullptr || fstat(fileno(file), &info) != 0 || S_ISDIR(info.st_mode)) {
        std::fclose(file);
        return nullptr;
    }
    slot->file = file;
    slot->pos = slot->end = slot->next_cr = 0;
    slot->at_end = false;
    return file;
}

int close_source(std::FILE *file) {
    if (file == nullptr) return 0;
    stream_state *slot = find_slot(file);
    if (slot != nullptr) slot->file = nullptr;
    return std::fclose(file) != 0 ? 1 : 0;
}

// A capacity below 2 has no room for a character: nothing is read. As with
// the C library's line reader, a read that gets no character leaves the line
// as it was.
bool read_line(std::FILE *file, char *line, std::size_t capacity) {
    if (line == nullptr || capacity < 2 || file == nullptr) return false;
    stream_state *s = find_slot(file);
    if (s == nullptr) return read_line_unbuffered(file, line, capacity);

    const std::size_t limit = capacity - 1;
    std::size_t out = 0;
    bool line_ended = false;
    while (out < limit && !line_ended) {
        if (s->pos == s->end) {
            if (s->at_end) break;
            refill(*s);
            continue;
        }
        // A run without CR: up to the next CR, the room left or a LF.
        std::size_t stop = s->pos + (limit - out);
        if (stop > s->next_cr) stop = s->next_cr;
        const unsigned char *run = s->block + s->pos;
        std::size_t n = stop - s->pos;
        if (const void *lf = std::memchr(run, '\n', n)) {
            n = static_cast<std::size_t>(static_cast<const unsigned char *>(lf) - run) + 1;
            line_ended = true;
        }
        std::memcpy(line + out, run, n);
        out += n;
        s->pos += n;
        if (line_ended || out == limit || s->pos != s->next_cr || s->pos == s->end) continue;

        // A CR: CR LF arrives as LF, a CR before anything else as CR.
        if (s->pos + 1 == s->end && !s->at_end) {
            refill(*s);  // its successor is in the next block
            continue;
        }
        if (s->pos + 1 < s->end && s->block[s->pos + 1] == '\n') {
            line[out++] = '\n';
            s->pos += 2;
            line_ended = true;
        } else {
            line[out++] = '\r';
            s->pos += 1;
        }
        find_next_cr(*s);
    }
    if (out == 0) return false;
    line[out] = '\0';
    return true;
}

}  // namespace tplex::platform
