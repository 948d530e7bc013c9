// The table file checker of tplex/table_output.h. Every read is checked
// against the size first; the findings are data, and printing them is left
// to the caller.
#include <cstdarg>
#include <cstdio>
#include <cstring>

#include "base/compiler.h"
#include "base/memory.h"
#include "base/text.h"
#include "table_output/references.h"
#include "tplex/table_output.h"

namespace tplex {

namespace {

constexpr std::uint32_t header_size = 16;

std::uint32_t word_at(const std::uint8_t *p) {
    return std::uint32_t{p[0]} | std::uint32_t{p[1]} << 8 | std::uint32_t{p[2]} << 16 |
           std::uint32_t{p[3]} << 24;
}

bool failed(table_check &check, const char *format, ...) TPLEX_PRINTF_FORMAT(2, 3);

bool failed(table_check &check, const char *format, ...) {
    va_list args;
    va_start(args, format);
    std::vsnprintf(check.error, sizeof check.error, format, args);
    va_end(args);
    return false;
}

int hex_digit(std::uint8_t c) {
    return digit_values[c] < 16 ? digit_values[c] : -1;
}

// Decodes hex text: " 0xHH" items, each after the first preceded by ",",
// every sixteenth also by a line break (LF or CR LF); a final line break is
// allowed. `out` has room for size / 5 + 1 bytes, the most items there can
// be. Returns false with the character offset of the first fault.
bool decode_hex(const std::uint8_t *text, std::size_t size, std::uint8_t *out, std::uint32_t &count,
                std::size_t &fault) {
    std::size_t p = 0;
    count = 0;
    auto line_break = [&](std::size_t at) -> std::size_t {  // its length, or 0
        if (at < size && text[at] == '\n') return 1;
        if (at + 1 < size && text[at] == '\r' && text[at + 1] == '\n') return 2;
        return 0;
    };
    while (p < size) {
        if (count > 0) {
            std::size_t end = line_break(p);
            if (end != 0 && p + end == size) break;
            if (text[p] != ',') return fault = p, false;
            ++p;
            if (count % 16 == 0) {
                std::size_t n = line_break(p);
                if (n == 0) return fault = p, false;
                p += n;
            }
        }
        if (size - p < 5 || text[p] != ' ' || text[p + 1] != '0' || text[p + 2] != 'x') {
            return fault = p, false;
        }
        int high = hex_digit(text[p + 3]);
        int low = hex_digit(text[p + 4]);
        if (high < 0 || low < 0) return fault = p, false;
        out[count++] = static_cast<std::uint8_t>(high << 4 | low);
        p += 5;
    }
    return true;
}

// The header's three rules: fixed word, length equal to the size, and a
// relocation table that starts aligned and holds whole entries.
bool check_header(table_check &c) {
    if (c.size < header_size) {
        return failed(c, "truncated: %u bytes, the header alone needs 16", c.size);
    }
    c.tag = word_at(c.table);
    c.length = word_at(c.table + 4);
    c.relocation_offset = word_at(c.table + 8);
    c.header_word = word_at(c.table + 12);
    std::uint32_t r = c.relocation_offset;
    if (c.header_word != header_word) {
        return failed(c, "header word at offset 12 is %u, not 60", c.header_word);
    }
    if (c.length == header_word && r == header_word && c.size != header_word) {
        return failed(c, "unfinished table: the header still holds 60 for length and relocations");
    }
    if (c.length != c.size) {
        return failed(c, "header says %u bytes, the table holds %u", c.length, c.size);
    }
    if (r < header_size || r > c.size || r % 4 != 0 || (c.size - r) % 8 != 0) {
        return failed(c, "relocation table offset %u does not fit a table of %u bytes", r, c.size);
    }
    c.relocation_count = (c.size - r) / 8;
    return true;
}

// Every entry: a placeholder wholly inside body or strings, a target below R.
bool check_relocations(table_check &c) {
    std::uint32_t r = c.relocation_offset;
    c.string_offset = r;
    for (std::uint32_t i = 0; i < c.relocation_count; ++i) {
        table_relocation entry = TableRelocationAt(&c, i);
        if (entry.location < header_size || entry.location > r - 4) {
            return failed(c, "relocation %u: location %u lies outside offsets 16 to %u", i,
                          entry.location, r - 4);
        }
        if (entry.target >= r) {
            return failed(c, "relocation %u: target %u is not below the relocation table at %u", i,
                          entry.target, r);
        }
        std::uint32_t word = word_at(c.table + entry.location);
        if (word == string_placeholder) {
            ++c.string_count;
            if (entry.target < c.string_offset) c.string_offset = entry.target;
        } else if (word != plain_placeholder) {
            return failed(c, "relocation %u: location %u holds 0x%08x, not a placeholder", i,
                          entry.location, word);
        }
    }
    return true;
}

// String targets: each starts a string that ends before R. The first
// referenced string need not start the string table (AddToStringStore can
// store strings that nothing refers to), so its offset need not be aligned.
bool check_strings(table_check &c) {
    if (c.string_count == 0) return true;
    std::uint32_t s = c.string_offset;
    std::uint32_t r = c.relocation_offset;
    if (s < header_size) {
        return failed(c, "string table offset %u lies in the header", s);
    }
    for (std::uint32_t i = 0; i < c.relocation_count; ++i) {
        table_relocation entry = TableRelocationAt(&c, i);
        if (!entry.is_string) continue;
        if (entry.target != s && c.table[entry.target - 1] != 0) {
            return failed(c, "relocation %u: target %u is not the start of a string", i,
                          entry.target);
        }
        if (std::memchr(c.table + entry.target, 0, r - entry.target) == nullptr) {
            return failed(c, "relocation %u: string at %u has no terminator before %u", i,
                          entry.target, r);
        }
    }
    return true;
}

}  // namespace

}  // namespace tplex

using tplex::check_header;
using tplex::check_relocations;
using tplex::check_strings;

extern "C" {

uint8_t CheckTable(const uint8_t *data, size_t size, table_check *result) {
    *result = table_check{};
    if (size > 0xFFFFFFFFu)
        return tplex::failed(*result, "larger than any table (%zu bytes)", size);
    result->table = data;
    result->size = static_cast<uint32_t>(size);
    // Hex text begins " 0x". A raw table whose tag happens to begin with
    // those bytes fails to decode and is then read as raw.
    if (size >= 3 && std::memcmp(data, " 0x", 3) == 0) {
        result->decoded = static_cast<uint8_t *>(tplex::mem_alloc(size / 5 + 1));
        if (result->decoded == nullptr) return tplex::failed(*result, "out of memory");
        uint32_t count = 0;
        size_t fault = 0;
        if (tplex::decode_hex(data, size, result->decoded, count, fault)) {
            result->table = result->decoded;
            result->size = count;
            result->hex_text = 1;
        } else {
            table_check raw{};
            raw.table = data;
            raw.size = result->size;
            if (check_header(raw) && check_relocations(raw) && check_strings(raw)) {
                ReleaseTableCheck(result);
                *result = raw;
                return 1;
            }
            return tplex::failed(*result, "malformed hex text at character %zu", fault);
        }
    }
    return check_header(*result) && check_relocations(*result) && check_strings(*result);
}

void ReleaseTableCheck(table_check *result) {
    tplex::mem_free(result->decoded);
    result->decoded = nullptr;
    result->table = nullptr;
    result->size = 0;
}

table_relocation TableRelocationAt(const table_check *check, uint32_t index) {
    const uint8_t *entry = check->table + check->relocation_offset + size_t{8} * index;
    table_relocation result{tplex::word_at(entry), tplex::word_at(entry + 4), 0};
    if (result.location <= check->relocation_offset - 4 && result.location >= tplex::header_size) {
        result.is_string =
            tplex::word_at(check->table + result.location) == tplex::string_placeholder;
    }
    return result;
}

const char *TableStringAt(const table_check *check, uint32_t offset) {
    return reinterpret_cast<const char *>(check->table + offset);
}

}  // extern "C"
