// Writes the table files that the tool's table command is tested on, with
// the table output module itself:
//   sound.tbl      raw, aligned: a forward reference, two strings
//   sound_hex.tbl  the same as hex text
//   damaged.tbl    sound.tbl with its relocation offset past the file's end
//
//   make_tables DIR
#include <cstdio>
#include <string>
#include <vector>

#include "tplex/table_output.h"

namespace {

bool write_table(const std::string &path, std::uint32_t flags) {
    std::uint32_t forward = 0;
    std::uint32_t defined = 0;
    return OpenOutput(path.c_str(), flags, 7) == 0 && WriteUInt32(0x11223344u) == 0 &&
           WriteReference(&forward, 0) == 0 && StoreString("PROTOCOL Signalling") == 0 &&
           WriteUInt8(1) == 0 && DefineReferenceHere(&defined, forward, 1) == 0 &&
           WriteUInt16(0xBEEF) == 0 && StoreString("call control") == 0 && CloseOutput() == 0;
}

}  // namespace

int main(int argc, char **argv) {
    if (argc != 2) {
        std::fprintf(stderr, "usage: make_tables DIR\n");
        return 2;
    }
    const std::string dir = argv[1];
    if (!write_table(dir + "/sound.tbl", TPLEX_OUT_ALIGN) ||
        !write_table(dir + "/sound_hex.tbl", TPLEX_OUT_ALIGN | TPLEX_OUT_HEX_TEXT)) {
        std::fprintf(stderr, "make_tables: writing a table failed\n");
        return 1;
    }
    FreeOutputTables();

    std::FILE *in = std::fopen((dir + "/sound.tbl").c_str(), "rb");
    if (in == nullptr) return 1;
    std::vector<unsigned char> bytes;
    int c;
    while ((c = std::fgetc(in)) != EOF) bytes.push_back(static_cast<unsigned char>(c));
    std::fclose(in);
    if (bytes.size() < 16) return 1;
    bytes[8] = 0xF0;  // R, little-endian, now far beyond the end
    bytes[9] = 0xFF;
    std::FILE *out = std::fopen((dir + "/damaged.tbl").c_str(), "wb");
    if (out == nullptr) return 1;
    const bool written = std::fwrite(bytes.data(), 1, bytes.size(), out) == bytes.size();
    return std::fclose(out) == 0 && written ? 0 : 1;
}
