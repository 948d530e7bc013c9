#include "services/file_names.h"

#include <cstddef>
#include <cstring>

#include "base/text.h"

namespace tplex {

namespace {

// Character classes: which parts of a path a byte may stand in.
constexpr std::uint8_t in_dir = 1;
constexpr std::uint8_t in_name = 2;

struct char_class_table {
    std::uint8_t of[256];
};

constexpr char_class_table make_char_classes() {
    char_class_table t{};
    for (int c = '0'; c <= '9'; ++c) t.of[c] = in_dir | in_name;
    for (int c = 'A'; c <= 'Z'; ++c) t.of[c] = in_dir | in_name;
    for (int c = 'a'; c <= 'z'; ++c) t.of[c] = in_dir | in_name;
    for (const char *p = "\\/~-:#._ "; *p != '\0'; ++p)
        t.of[static_cast<unsigned char>(*p)] |= in_dir;
    for (const char *p = "/~-:_. "; *p != '\0'; ++p)
        t.of[static_cast<unsigned char>(*p)] |= in_name;
    return t;
}

constexpr char_class_table char_classes = make_char_classes();

static_assert(char_classes.of[static_cast<unsigned char>('#')] == in_dir, "hash: directory only");
static_assert(char_classes.of[static_cast<unsigned char>('\\')] == in_dir,
              "backslash: directory only");
static_assert(char_classes.of[static_cast<unsigned char>('/')] == (in_dir | in_name),
              "slash: both");
static_assert(char_classes.of[0] == 0 && char_classes.of[0x80] == 0 &&
                  char_classes.of[static_cast<unsigned char>('$')] == 0,
              "NUL, bytes above 127 and the marker are refused");

bool is_separator(char c) {
    return c == '\\' || c == '/';
}

// Copies the first len characters of src into a field of size cap, cutting
// them to cap - 1 characters.
void copy_cut(char *field, std::size_t cap, const char *src, std::size_t len) {
    if (len > cap - 1) len = cap - 1;
    std::memcpy(field, src, len);
    field[len] = '\0';
}

bool all_chars_allowed(const char *text, std::uint8_t (*bad)(char)) {
    for (; *text != '\0'; ++text) {
        if (bad(*text) != 0) return false;
    }
    return true;
}

}  // namespace

std::uint8_t bad_dir_char(char c) {
    return (char_classes.of[static_cast<unsigned char>(c)] & in_dir) != 0 ? 0 : 1;
}

std::uint8_t bad_name_char(char c) {
    return (char_classes.of[static_cast<unsigned char>(c)] & in_name) != 0 ? 0 : 1;
}

}  // namespace tplex

using namespace tplex;  // the helpers above, for the C functions below

extern "C" {

// A null path or expected extension reads as an empty text.
void split_file_spec(char *path, const char *expected_ext, file_spec *out) {
    if (out == nullptr) return;
    if (expected_ext == nullptr) expected_ext = "";
    out->dir_part[0] = out->name_part[0] = out->ext_part[0] = '\0';
    if (path == nullptr) return;

    if (std::strcmp(path, "$") == 0) {
        copy_text(out->name_part, sizeof out->name_part, path);
        copy_text(out->ext_part, sizeof out->ext_part, expected_ext);
        return;
    }

    // The last separator splits off the directory, unless it is the first
    // character: then it stays part of the name.
    std::size_t len = std::strlen(path);
    std::size_t sep = len;
    while (sep > 0 && !is_separator(path[sep - 1])) --sep;
    if (sep > 1) {
        copy_cut(out->dir_part, sizeof out->dir_part, path, sep - 1);
        std::memmove(path, path + sep, len - sep + 1);
        len -= sep;
    }

    // The last full stop starts the extension, unless it is the first
    // character. "c." has an empty extension.
    const char *dot = std::strrchr(path, '.');
    if (dot == path) dot = nullptr;
    const char *found_ext = dot != nullptr ? dot + 1 : "";

    if (std::strcmp(found_ext, expected_ext) == 0) {
        std::size_t name_len = dot != nullptr ? static_cast<std::size_t>(dot - path) : len;
        copy_cut(out->name_part, sizeof out->name_part, path, name_len);
        copy_text(out->ext_part, sizeof out->ext_part, expected_ext);
    } else {
        copy_cut(out->name_part, sizeof out->name_part, path, len);
    }
}

// A null name changes nothing.
void apply_default_name(file_spec *parts, const char *name) {
    if (parts == nullptr || name == nullptr) return;
    if (std::strcmp(parts->name_part, "$") == 0)
        copy_text(parts->name_part, sizeof parts->name_part, name);
}

// A field without a NUL inside it (a record filled by hand) counts as too
// long, so nothing is read past a field.
uint8_t file_spec_invalid(const file_spec *parts) {
    if (parts == nullptr) return 1;
    const std::size_t dir_len = text_length(parts->dir_part, sizeof parts->dir_part);
    const std::size_t name_len = text_length(parts->name_part, sizeof parts->name_part);
    const std::size_t ext_len = text_length(parts->ext_part, sizeof parts->ext_part);
    if (dir_len > spec_dir_max || name_len > spec_name_max || ext_len > spec_ext_max) return 1;
    if (name_len == 0 && dir_len != 0) return 1;
    if (!all_chars_allowed(parts->dir_part, bad_dir_char)) return 1;
    if (!all_chars_allowed(parts->name_part, bad_name_char)) return 1;
    if (!all_chars_allowed(parts->ext_part, bad_name_char)) return 1;
    return 0;
}

}  // extern "C"
