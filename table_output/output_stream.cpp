// The table output byte stream: PutByte and its sinks, the little-endian
// writers, alignment, blocks and memory output.
#include "table_output/output_stream.h"

#include <cstdarg>
#include <cstring>

#include "base/memory.h"

namespace tplex {

output_stream_state output_stream{};

void set_output_switches(std::uint32_t flags) {
    output_stream_state &s = output_stream;
    s.align = (flags & TPLEX_OUT_ALIGN) != 0;
    s.hex_text = (flags & TPLEX_OUT_HEX_TEXT) != 0;
    s.drop_newlines = (flags & TPLEX_OUT_DROP_NEWLINES) != 0;
    s.diagnostics = (flags & TPLEX_OUT_DIAGNOSTICS) != 0;
    s.literal_backslash = (flags & TPLEX_OUT_LITERAL_BACKSLASH) != 0;
}

// The block stack is left as it is: the caller balances BeginBlock and
// EndBlock within one output.
void begin_stream() {
    output_stream.offset = 0;
}

void report(const char *format, ...) {
    if (!output_stream.diagnostics) return;
    va_list args;
    va_start(args, format);
    std::vfprintf(stderr, format, args);
    va_end(args);
}

void close_output_file() {
    if (output_stream.file == nullptr) return;
    std::fclose(output_stream.file);
    output_stream.file = nullptr;
}

status_code fail_write() {
    close_output_file();
    report("sg_TableOutput: Fatal erorr: Write byte error\n");
    return TPLEX_OUT_WRITE_FAILED;
}

status_code fill_to(std::uint32_t boundary, std::uint8_t fill) {
    // Ends: every successful PutByte advances the offset.
    while (output_stream.offset % boundary != 0) {
        status_code status = PutByte(fill);
        if (status != TPLEX_OK) return status;
    }
    return TPLEX_OK;
}

byte_chunk *new_chunk() {
    auto *chunk = static_cast<byte_chunk *>(mem_alloc(sizeof(byte_chunk)));
    if (chunk == nullptr) return nullptr;
    chunk->link = nullptr;
    chunk->used = 0;
    return chunk;
}

void release_chunks(byte_chunk *first) {
    while (first != nullptr) {
        byte_chunk *next = first->link;
        mem_free(first);
        first = next;
    }
}

namespace {

// The file sink. In hex text mode every item but the first is preceded by
// ",", and every sixteenth also by a line break, so the text of bytes 0 to 11
// has a fixed length and the header can be rewritten in place. Text write
// failures are detected like raw ones, so a full disk never passes silently.
status_code put_file_byte(std::uint8_t b) {
    output_stream_state &s = output_stream;
    if (s.file == nullptr) return TPLEX_OUT_WRITE_FAILED;  // reported when it closed
    if (!s.hex_text) {
        if (std::fputc(b, s.file) == EOF) return fail_write();
    } else {
        const char *separator = s.offset == 0 ? "" : s.offset % 16 == 0 ? ",\n" : ",";
        if (std::fprintf(s.file, "%s 0x%02x", separator, static_cast<unsigned>(b)) < 0) {
            return fail_write();
        }
    }
    ++s.offset;
    return TPLEX_OK;
}

// The memory sink: appends, starting a new chunk when the current one is
// full. A failed allocation loses the byte and leaves the offset.
status_code put_memory_byte(std::uint8_t b) {
    output_stream_state &s = output_stream;
    byte_chunk *chunk = s.memory_current;
    if (chunk->used == chunk_size) {
        byte_chunk *next = new_chunk();
        if (next == nullptr) return TPLEX_OUT_NO_MEMORY_CHUNK;
        chunk->link = next;
        s.memory_current = chunk = next;
    }
    chunk->data[chunk->used++] = b;
    ++s.memory_total;
    // Memory output is a stream of its own, so its bytes count: alignment
    // and blocks then work within the image (see StartMemoryOutput).
    ++s.offset;
    return TPLEX_OK;
}

// Writes the low `bytes` bytes of v, lowest first, after filling to `align`
// when the alignment switch is on.
status_code write_le(std::uint32_t v, int bytes, std::uint32_t align) {
    if (output_stream.align && align > 1) {
        status_code status = fill_to(align);
        if (status != TPLEX_OK) return status;
    }
    for (int i = 0; i < bytes; ++i) {
        status_code status = PutByte(static_cast<std::uint8_t>(v >> (8 * i)));
        if (status != TPLEX_OK) return status;
    }
    return TPLEX_OK;
}

}  // namespace

}  // namespace tplex

using tplex::output_stream;

extern "C" {

status_code PutByte(uint8_t b) {
    return output_stream.memory ? tplex::put_memory_byte(b) : tplex::put_file_byte(b);
}

status_code WriteInt8(int8_t v) {
    return tplex::write_le(static_cast<uint8_t>(v), 1, 1);
}
status_code WriteUInt8(uint8_t v) {
    return tplex::write_le(v, 1, 1);
}
status_code WriteInt16(int16_t v) {
    return tplex::write_le(static_cast<uint16_t>(v), 2, 2);
}
status_code WriteUInt16(uint16_t v) {
    return tplex::write_le(v, 2, 2);
}
status_code WriteInt32(int32_t v) {
    return tplex::write_le(static_cast<uint32_t>(v), 4, 4);
}
status_code WriteUInt32(uint32_t v) {
    return tplex::write_le(v, 4, 4);
}

status_code AlignOutput(uint32_t boundary) {
    return tplex::fill_to(boundary == 2 ? 2 : 4);
}

status_code BeginBlock(void) {
    if (output_stream.block_depth == tplex::block_stack_size) return TPLEX_OUT_TOO_MANY_BLOCKS;
    output_stream.block_start[output_stream.block_depth++] = output_stream.offset;
    return TPLEX_OK;
}

// Fills the block to a multiple of its step: 4 below 4 bytes, 8 from 4 to 7,
// 16 from 8 on; measured from the block's start, whatever the switches.
status_code EndBlock(void) {
    if (output_stream.block_depth == 0) return TPLEX_OUT_NO_OPEN_BLOCK;
    uint32_t length = output_stream.offset - output_stream.block_start[--output_stream.block_depth];
    uint32_t step = length < 4 ? 4 : length < 8 ? 8 : 16;
    for (; length % step != 0; ++length) {
        status_code status = PutByte(tplex::fill_byte);
        if (status != TPLEX_OK) return status;
    }
    return TPLEX_OK;
}

// Memory output is chosen by this call, not by OpenOutput's flags, and never
// runs beside a table file: positions recorded for the file could otherwise
// point at bytes that went to memory.
status_code StartMemoryOutput(void) {
    if (output_stream.file != nullptr) return TPLEX_OUT_CANNOT_OPEN;
    // Allocate before releasing, so a failure keeps the earlier image.
    tplex::byte_chunk *first = tplex::new_chunk();
    if (first == nullptr) return TPLEX_OUT_NO_MEMORY_CHUNK;
    tplex::release_chunks(output_stream.memory_first);
    output_stream.memory_first = output_stream.memory_current = first;
    output_stream.memory_total = 0;
    output_stream.memory = true;
    tplex::begin_stream();
    output_stream.block_depth = 0;  // an image is a stream of its own
    return TPLEX_OK;
}

status_code StopMemoryOutput(void) {
    output_stream.memory = false;
    return TPLEX_OK;
}

uint32_t MemoryOutputSize(void) {
    return output_stream.memory_total;
}

uint32_t CopyMemoryOutput(uint8_t *buffer, uint32_t size) {
    uint32_t copied = 0;
    for (const tplex::byte_chunk *chunk = output_stream.memory_first;
         chunk != nullptr && copied < size; chunk = chunk->link) {
        uint32_t part = chunk->used < size - copied ? chunk->used : size - copied;
        std::memcpy(buffer + copied, chunk->data, part);
        copied += part;
    }
    return copied;
}

status_code FreeMemoryOutput(void) {
    tplex::release_chunks(output_stream.memory_first);
    output_stream.memory_first = output_stream.memory_current = nullptr;
    output_stream.memory_total = 0;
    output_stream.memory = false;
    return TPLEX_OK;
}

}  // extern "C"
