// make_tables DIR: writes with the table output module the tables the tool's
// table command is tested on: sound.tbl (raw, aligned: a forward reference,
// two strings) and damaged.tbl (its relocation offset past the file's end).
#include <cstdio>
#include <string>

#include "tplex/table_output.h"

int main(int argc, char **argv) {
    if (argc != 2) return 2;
    const std::string sound = std::string(argv[1]) + "/sound.tbl";
    std::uint32_t forward = 0, defined = 0;
    if (OpenOutput(sound.c_str(), TPLEX_OUT_ALIGN, 7) != 0 || WriteUInt32(0x11223344u) != 0 ||
        WriteReference(&forward, 0) != 0 || StoreString("PROTOCOL Signalling") != 0 ||
        WriteUInt8(1) != 0 || DefineReferenceHere(&defined, forward, 1) != 0 ||
        WriteUInt16(0xBEEF) != 0 || StoreString("call control") != 0 || CloseOutput() != 0)
        return 1;
    FreeOutputTables();
    unsigned char bytes[4096];
    std::FILE *in = std::fopen(sound.c_str(), "rb");
    const std::size_t n = in != nullptr ? std::fread(bytes, 1, sizeof bytes, in) : 0;
    if (in == nullptr || std::fclose(in) != 0 || n < 16) return 1;
    bytes[8] = 0xF0, bytes[9] = 0xFF;  // R, little-endian, now far beyond the end
    std::FILE *out = std::fopen((std::string(argv[1]) + "/damaged.tbl").c_str(), "wb");
    const bool written = out != nullptr && std::fwrite(bytes, 1, n, out) == n;
    return out != nullptr && std::fclose(out) == 0 && written ? 0 : 1;
}
