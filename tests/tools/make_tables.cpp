// make_tables DIR: writes DIR/sound.tbl with the table output module, the
// table the tool's table command is tested on: raw, aligned, a forward
// reference and two strings.
#include <cstdint>
#include <string>

#include "tplex/table_output.h"

int main(int argc, char **argv) {
    if (argc != 2) return 2;
    std::uint32_t forward = 0;
    if (OpenOutput((std::string(argv[1]) + "/sound.tbl").c_str(), TPLEX_OUT_ALIGN, 7) != 0 ||
        WriteUInt32(0x11223344u) != 0 || WriteReference(&forward, 0) != 0 ||
        StoreString("PROTOCOL Signalling") != 0 || WriteUInt8(1) != 0 ||
        DefineReferenceHere(nullptr, forward, 1) != 0 || WriteUInt16(0xBEEF) != 0 ||
        StoreString("call control") != 0 || CloseOutput() != 0)
        return 1;
    return FreeOutputTables();
}
