// The table file inspector. Every read is checked against the size first.
#include "table_output/table_check.h"

#include <cstdarg>
#include <cstring>

#include "base/compiler.h"
#include "base/memory.h"
#include "table_output/references.h"

namespace tplex {

namespace {

constexpr std::uint32_t header_size = 16;

std::uint32_t word_at(const std::uint8_t *p) {
    return std::uint32_t{p[0]} | std::uint32_t{p[1]} << 8 | std::uint32_t{p[2]} << 16 |
           std::uint32_t{p[3]} << 24;
}

bool failed(TableCheck &check, const char *format, ...) TPLEX_PRINTF_FORMAT(2, 3);

bool failed(TableCheck &check, const char *format, ...) {
    va_list args;
    va_start(args, format);
    std::vsnprintf(check.error, sizeof check.error, format, args);
    va_end(args);
    return false;
}

int hex_digit(std::uint8_t c) {
    if (c >= '0' && c <= '9') return c - '0';
    if (c >= 'a' && c <= 'f') return c - 'a' + 10;
    if (c >= 'A' && c <= 'F') return c - 'A' + 10;
    return -1;
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
bool check_header(TableCheck &c) {
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
bool check_relocations(TableCheck &c) {
    std::uint32_t r = c.relocation_offset;
    c.string_offset = r;
    for (std::uint32_t i = 0; i < c.relocation_count; ++i) {
        TableRelocation entry = table_relocation(c, i);
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
bool check_strings(TableCheck &c) {
    if (c.string_count == 0) return true;
    std::uint32_t s = c.string_offset;
    std::uint32_t r = c.relocation_offset;
    if (s < header_size) {
        return failed(c, "string table offset %u lies in the header", s);
    }
    for (std::uint32_t i = 0; i < c.relocation_count; ++i) {
        TableRelocation entry = table_relocation(c, i);
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

void print_quoted(const char *text, std::FILE *out) {
    std::fputc('"', out);
    for (const char *p = text; *p != '\0'; ++p) {
        auto c = static_cast<unsigned char>(*p);
        if (c == '"' || c == '\\') {
            std::fprintf(out, "\\%c", c);
        } else if (c == '\n') {
            std::fputs("\\n", out);
        } else if (c < 0x20 || c >= 0x7F) {
            std::fprintf(out, "\\x%02x", c);
        } else {
            std::fputc(c, out);
        }
    }
    std::fputc('"', out);
}

}  // namespace

bool check_table(const std::uint8_t *data, std::size_t size, TableCheck &result) {
    result = TableCheck{};
    if (size > 0xFFFFFFFFu) return failed(result, "larger than any table (%zu bytes)", size);
    result.table = data;
    result.size = static_cast<std::uint32_t>(size);
    // Hex text begins " 0x". A raw table whose tag happens to begin with
    // those bytes fails to decode and is then read as raw.
    if (size >= 3 && std::memcmp(data, " 0x", 3) == 0) {
        result.decoded = static_cast<std::uint8_t *>(mem_alloc(size / 5 + 1));
        if (result.decoded == nullptr) return failed(result, "out of memory");
        std::uint32_t count = 0;
        std::size_t fault = 0;
        if (decode_hex(data, size, result.decoded, count, fault)) {
            result.table = result.decoded;
            result.size = count;
            result.hex_text = true;
        } else {
            TableCheck raw{};
            raw.table = data;
            raw.size = result.size;
            if (check_header(raw) && check_relocations(raw) && check_strings(raw)) {
                release_table_check(result);
                result = raw;
                return true;
            }
            return failed(result, "malformed hex text at character %zu", fault);
        }
    }
    return check_header(result) && check_relocations(result) && check_strings(result);
}

void release_table_check(TableCheck &result) {
    mem_free(result.decoded);
    result.decoded = nullptr;
    result.table = nullptr;
    result.size = 0;
}

TableRelocation table_relocation(const TableCheck &check, std::uint32_t index) {
    const std::uint8_t *entry = check.table + check.relocation_offset + std::size_t{8} * index;
    TableRelocation result{word_at(entry), word_at(entry + 4), false};
    if (result.location <= check.relocation_offset - 4 && result.location >= header_size) {
        result.is_string = word_at(check.table + result.location) == string_placeholder;
    }
    return result;
}

const char *table_string(const TableCheck &check, std::uint32_t offset) {
    return reinterpret_cast<const char *>(check.table + offset);
}

void print_table_summary(const TableCheck &c, std::FILE *out) {
    std::uint32_t body_end = c.string_offset;
    std::fprintf(out, "form: %s, %u bytes\n", c.hex_text ? "hex text" : "raw", c.size);
    std::fprintf(out, "header: tag %u, length %u, relocations at %u, word %u\n", c.tag, c.length,
                 c.relocation_offset, c.header_word);
    std::fprintf(out, "body: %u bytes at offsets 16 to %u\n", body_end - header_size, body_end);
    std::fprintf(out, "strings: %u, string table at %u\n", c.string_count, c.string_offset);
    for (std::uint32_t i = 0; i < c.relocation_count; ++i) {
        TableRelocation entry = table_relocation(c, i);
        if (!entry.is_string) continue;
        std::fprintf(out, "  %u: ", entry.target);
        print_quoted(table_string(c, entry.target), out);
        std::fputc('\n', out);
    }
    std::fprintf(out, "relocations: %u\n", c.relocation_count);
    for (std::uint32_t i = 0; i < c.relocation_count; ++i) {
        TableRelocation entry = table_relocation(c, i);
        std::fprintf(out, "  %u -> %u%s\n", entry.location, entry.target,
                     entry.is_string ? " (string)" : "");
    }
}

int inspect_table_file(const char *path, std::FILE *out, std::FILE *err) {
    std::FILE *file = std::fopen(path, "rb");
    if (file == nullptr) {
        std::fprintf(err, "tplex table: cannot open '%s'\n", path);
        return 1;
    }
    long size = -1;
    if (std::fseek(file, 0, SEEK_END) == 0) size = std::ftell(file);
    std::uint8_t *data = nullptr;
    bool read = size >= 0 && std::fseek(file, 0, SEEK_SET) == 0 &&
                (data = static_cast<std::uint8_t *>(mem_alloc(size > 0 ? size : 1))) != nullptr &&
                std::fread(data, 1, size, file) == static_cast<std::size_t>(size);
    std::fclose(file);
    if (!read) {
        mem_free(data);
        std::fprintf(err, "tplex table: cannot read '%s'\n", path);
        return 1;
    }
    TableCheck check{};
    bool sound = check_table(data, static_cast<std::size_t>(size), check);
    if (sound) {
        std::fprintf(out, "file: %s\n", path);
        print_table_summary(check, out);
    } else {
        std::fprintf(err, "tplex table: %s: %s\n", path, check.error);
    }
    release_table_check(check);
    mem_free(data);
    return sound ? 0 : 1;
}

}  // namespace tplex
