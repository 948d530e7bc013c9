#include "report.h"

#include <cstdio>
#include <cstring>

#include "tplex/services.h"

namespace tplex::tool {

namespace {

// Takes apart "\nTemplate compiler error :\nMESSAGE\nFile: PATH    Line: N\nSOURCE".
Diagnostic parse_diagnostic(const std::string &text) {
    static const std::string header = "Template compiler error :\n";
    static const std::string file_tag = "File: ";
    static const std::string line_tag = "    Line: ";
    Diagnostic d;
    std::size_t pos = text.find(header);
    pos = pos == std::string::npos ? 0 : pos + header.size();
    std::size_t end = text.find('\n', pos);
    d.message = text.substr(pos, end == std::string::npos ? std::string::npos : end - pos);
    if (end == std::string::npos || text.compare(end + 1, file_tag.size(), file_tag) != 0) return d;
    const std::size_t path_start = end + 1 + file_tag.size();
    const std::size_t line_end = text.find('\n', path_start);
    const std::string position = text.substr(
        path_start, line_end == std::string::npos ? std::string::npos : line_end - path_start);
    const std::size_t tag = position.rfind(line_tag);
    if (tag == std::string::npos) return d;
    d.has_position = true;
    d.file = position.substr(0, tag);
    d.line = std::strtol(position.c_str() + tag + line_tag.size(), nullptr, 10);
    if (line_end != std::string::npos) {
        d.source = text.substr(line_end + 1);
        while (!d.source.empty() && (d.source.back() == '\n' || d.source.back() == '\r'))
            d.source.pop_back();
    }
    return d;
}

// The length of the well-formed UTF-8 sequence at text[i] (2 to 4), or 0
// when the byte there (at or above 0x80) starts none: no overlong forms,
// no surrogates, nothing above U+10FFFF.
std::size_t utf8_length(const std::string &text, std::size_t i) {
    const auto byte = [&](std::size_t k) {
        return k < text.size() ? static_cast<unsigned char>(text[k]) : 0u;
    };
    const unsigned c = byte(i);
    std::size_t n;
    unsigned low = 0x80, high = 0xBF;  // the allowed range of the second byte
    if (c >= 0xC2 && c <= 0xDF) {
        n = 2;
    } else if (c >= 0xE0 && c <= 0xEF) {
        n = 3;
        if (c == 0xE0) low = 0xA0;
        if (c == 0xED) high = 0x9F;
    } else if (c >= 0xF0 && c <= 0xF4) {
        n = 4;
        if (c == 0xF0) low = 0x90;
        if (c == 0xF4) high = 0x8F;
    } else {
        return 0;
    }
    if (byte(i + 1) < low || byte(i + 1) > high) return 0;
    for (std::size_t k = 2; k < n; ++k)
        if (byte(i + k) < 0x80 || byte(i + k) > 0xBF) return 0;
    return n;
}

// Text between double quotes, with \\ \" \n \r \t, and every other byte
// below 32 or above 126 written with the printf format `other`. With
// utf8_as_is, well-formed UTF-8 sequences are copied unchanged.
std::string escaped(const std::string &text, const char *other, bool utf8_as_is) {
    std::string out = "\"";
    for (std::size_t i = 0; i < text.size(); ++i) {
        const char ch = text[i];
        const auto c = static_cast<unsigned char>(ch);
        switch (c) {
            case '\\':
                out += "\\\\";
                break;
            case '"':
                out += "\\\"";
                break;
            case '\n':
                out += "\\n";
                break;
            case '\r':
                out += "\\r";
                break;
            case '\t':
                out += "\\t";
                break;
            default: {
                if (c >= 32 && c <= 126) {
                    out += ch;
                    break;
                }
                const bool outside_ascii = utf8_as_is && c > 127;
                const std::size_t n = outside_ascii ? utf8_length(text, i) : 0;
                if (n > 0) {
                    out.append(text, i, n);
                    i += n - 1;
                    break;
                }
                // A stray byte becomes the lone surrogate 0xDC00 + byte,
                // which no well-formed text holds: the byte stays recoverable.
                char code[8];
                std::snprintf(code, sizeof code, other, outside_ascii ? 0xDC00u + c : c);
                out += code;
            }
        }
    }
    return out + "\"";
}

}  // namespace

Diagnostic diagnostic_of(status_code code) {
    char text[TPLEX_DIAGNOSTIC_SIZE];
    const std::size_t n = sg_FormatError(code, text, sizeof text);
    return parse_diagnostic(std::string(text, n < sizeof text ? n : sizeof text - 1));
}

void print_table_summary(const table_check &c, std::FILE *out) {
    const std::uint32_t header_size = 16;
    std::uint32_t body_end = c.string_offset;
    std::fprintf(out, "form: %s, %u bytes\n", c.hex_text ? "hex text" : "raw", c.size);
    std::fprintf(out, "header: tag %u, length %u, relocations at %u, word %u\n", c.tag, c.length,
                 c.relocation_offset, c.header_word);
    std::fprintf(out, "body: %u bytes at offsets 16 to %u\n", body_end - header_size, body_end);
    std::fprintf(out, "strings: %u, string table at %u\n", c.string_count, c.string_offset);
    for (std::uint32_t i = 0; i < c.relocation_count; ++i) {
        table_relocation entry = TableRelocationAt(&c, i);
        if (!entry.is_string) continue;
        std::fprintf(out, "  %u: %s\n", entry.target,
                     quoted(TableStringAt(&c, entry.target)).c_str());
    }
    std::fprintf(out, "relocations: %u\n", c.relocation_count);
    for (std::uint32_t i = 0; i < c.relocation_count; ++i) {
        table_relocation entry = TableRelocationAt(&c, i);
        std::fprintf(out, "  %u -> %u%s\n", entry.location, entry.target,
                     entry.is_string ? " (string)" : "");
    }
}

std::string kind_name(std::uint16_t kind) {
    switch (kind) {
        case tk_number:
            return "number";
        case tk_string:
            return "string";
        case tk_operator:
            return "operator";
        case tk_macro:
            return "macro";
        case tk_end_of_input:
            return "end-of-input";
        case tk_reserved_word:
            return "reserved-word";
        case tk_new_identifier:
            return "identifier";
        case tk_undeclared:
            return "undeclared";
        case tk_hash_word:
            return "hash-word";
        case tk_hash_definition:
            return "hash-definition";
        case tk_pdf_string:
            return "pdf-string";
        case tk_char:
            return "char";
        case tk_end_of_line:
            return "end-of-line";
        default:
            break;
    }
    if (kind >= tk_first_class && kind <= tk_last_class) return "class-" + std::to_string(kind);
    return "kind-" + std::to_string(kind);
}

bool kind_has_value(std::uint16_t kind) {
    return kind == tk_number || kind == tk_operator || kind == tk_reserved_word ||
           (kind >= tk_undeclared && kind <= tk_last_class);
}

std::string operator_spelling(std::int32_t value) {
    switch (value) {
        case op_slash_equal:
            return "/=";
        case op_or_or:
            return "||";
        case op_and_and:
            return "&&";
        case op_less_equal:
            return "<=";
        case op_greater_equal:
            return ">=";
        case op_shift_left:
            return "<<";
        case op_shift_right:
            return ">>";
        case op_dot_dot:
            return "..";
        case op_xor_xor:
            return "^^";
        case op_not_equal:
            return "!=";
        default:
            return std::string(1, static_cast<char>(value & 0xFF));
    }
}

std::string quoted(const std::string &text) {
    return escaped(text, "\\x%02x", false);
}

std::string json_string(const std::string &text) {
    return escaped(text, "\\u%04x", true);
}

std::string display_path(std::string path) {
#ifndef _WIN32
    for (char &c : path)
        if (c == '\\') c = '/';
#endif
    return path;
}

std::string hex_code(status_code code) {
    char buffer[16];
    std::snprintf(buffer, sizeof buffer, "0x%08x", static_cast<unsigned>(code));
    return buffer;
}

}  // namespace tplex::tool
