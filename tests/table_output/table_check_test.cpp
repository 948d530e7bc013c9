// The table inspector on sound, broken, truncated and malformed tables.
#include <string>

#include "table_fixture.h"

namespace tplex::test {
namespace {

class Inspector : public TableTest {
protected:
    // A small sound table: 16>20 plain, 24>28 the string "ab"; R 32, 48 bytes.
    Bytes sample(std::uint32_t flags = 0) {
        open(flags);
        std::uint32_t id;
        WriteReference(&id, 0), DefineReferenceHere(nullptr, id, 0), WriteUInt32(0);
        StoreString("ab");
        EXPECT_EQ(CloseOutput(), TPLEX_OK);
        return file();
    }
    // CheckTable's complaint about the bytes, "" for a sound table.
    static std::string error_of(const Bytes &b) {
        table_check c{};
        std::string error = CheckTable(b.data(), b.size(), &c) ? "" : c.error;
        ReleaseTableCheck(&c);
        return error;
    }
    static Bytes set(Bytes b, std::size_t at, std::uint32_t v) {
        for (std::size_t i = 0; i < 4 && at + i < b.size(); ++i)
            b[at + i] = static_cast<std::uint8_t>(v >> 8 * i);
        return b;
    }
};

TEST_F(Inspector, BrokenTables) {
    const Bytes b = sample();
    const std::pair<Bytes, const char *> cases[] = {
        {b, ""},
        {set(b, 12, 61), "header word at offset 12 is 61, not 60"},
        {set(set(b, 4, 60), 8, 60),
         "unfinished table: the header still holds 60 for length and relocations"},
        {set(b, 4, 44), "header says 44 bytes, the table holds 48"},
        {set(b, 8, 30), "relocation table offset 30 does not fit a table of 48 bytes"},
        {set(b, 32, 30), "relocation 0: location 30 lies outside offsets 16 to 28"},
        {set(b, 36, 32), "relocation 0: target 32 is not below the relocation table at 32"},
        {set(b, 16, 7), "relocation 0: location 16 holds 0x00000007, not a placeholder"},
        {set(set(b, 32, 24), 36, 29), "relocation 0: target 29 is not the start of a string"},
        {set(b, 28, 0x63636363), "relocation 1: string at 28 has no terminator before 32"},
    };
    for (const auto &[bytes, error] : cases) EXPECT_EQ(error_of(bytes), error);
}

// Every prefix of a sound table, raw or hex text, is refused; each is an
// exact-size copy, so the sanitizer sees any read past the data.
TEST_F(Inspector, TruncatedAndMalformed) {
    for (std::uint32_t flags : {0u, TPLEX_OUT_HEX_TEXT}) {
        Bytes b = sample(flags);
        for (std::size_t n = 0; n < b.size(); ++n)
            EXPECT_NE(error_of(Bytes(b.begin(), b.begin() + n)), "") << n;
    }
    Bytes text = sample(TPLEX_OUT_HEX_TEXT);
    text[11] = ';';
    EXPECT_EQ(error_of(text), "malformed hex text at character 11");
}

}  // namespace
}  // namespace tplex::test
