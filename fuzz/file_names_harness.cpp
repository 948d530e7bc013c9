#include "file_names_harness.h"

#include <cstring>
#include <string>
#include <vector>

#include "harness_support.h"
#include "services/file_names.h"

namespace tplex::fuzz {

namespace {

// A NUL-terminated copy on the heap, sized exactly, so a write or read past
// its end is caught.
std::vector<char> text_of(const part &p) {
    std::vector<char> t(p.data, p.data + p.size);
    t.push_back('\0');
    return t;
}

bool allowed(const char *text, std::uint8_t (*bad)(char)) {
    for (; *text != '\0'; ++text)
        if (bad(*text) != 0) return false;
    return true;
}

void check_fits(const file_spec &f) {
    TPLEX_FUZZ_CHECK(terminated(f.dir_part, sizeof f.dir_part), 0);
    TPLEX_FUZZ_CHECK(terminated(f.name_part, sizeof f.name_part), 0);
    TPLEX_FUZZ_CHECK(terminated(f.ext_part, sizeof f.ext_part), 0);
}

}  // namespace

void run_file_names(const std::uint8_t *data, std::size_t size) {
    part parts[3];
    split_input(data, size, parts, 3);
    std::vector<char> path = text_of(parts[0]);
    const std::vector<char> ext = text_of(parts[1]);
    const std::vector<char> name = text_of(parts[2]);
    const std::string original(path.data());

    // Poisoned fields: whatever the split leaves unset shows up.
    auto *f = new file_spec;
    std::memset(f, 0x7F, sizeof *f);
    split_file_spec(path.data(), ext.data(), f);
    check_fits(*f);
    // The path only ever loses its directory.
    const std::size_t kept = std::strlen(path.data());
    TPLEX_FUZZ_CHECK(kept <= original.size(), kept);
    TPLEX_FUZZ_CHECK(original.compare(original.size() - kept, kept, path.data()) == 0, kept);
    TPLEX_FUZZ_CHECK(f->ext_part[0] == '\0' || std::strcmp(f->ext_part, ext.data()) == 0 ||
                         std::strlen(ext.data()) >= sizeof f->ext_part,
                     0);

    apply_default_name(f, name.data());
    check_fits(*f);
    const std::uint8_t invalid = file_spec_invalid(f);
    TPLEX_FUZZ_CHECK(invalid <= 1, invalid);
    if (invalid == 0) {
        TPLEX_FUZZ_CHECK(std::strlen(f->dir_part) <= spec_dir_max, 0);
        TPLEX_FUZZ_CHECK(std::strlen(f->name_part) <= spec_name_max, 0);
        TPLEX_FUZZ_CHECK(std::strlen(f->ext_part) <= spec_ext_max, 0);
        TPLEX_FUZZ_CHECK(f->name_part[0] != '\0' || f->dir_part[0] == '\0', 0);
        TPLEX_FUZZ_CHECK(allowed(f->dir_part, bad_dir_char), 0);
        TPLEX_FUZZ_CHECK(allowed(f->name_part, bad_name_char), 0);
        TPLEX_FUZZ_CHECK(allowed(f->ext_part, bad_name_char), 0);
    }
    delete f;
}

}  // namespace tplex::fuzz
