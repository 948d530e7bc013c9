// File framing, references and the string store.
#include <string>

#include "table_fixture.h"

namespace tplex::test {
namespace {

class ReferencesTest : public TableTest {
protected:
    // "tag length R 60" of a closed table.
    static std::string header(const TableCheck &c) {
        return std::to_string(c.tag) + " " + std::to_string(c.length) + " " +
               std::to_string(c.relocation_offset) + " " + std::to_string(c.header_word);
    }
    // "location>target" of every relocation entry, in file order.
    static std::string entries(const TableCheck &c) {
        std::string s;
        for (std::uint32_t i = 0; i < c.relocation_count; ++i) {
            TableRelocation e = table_relocation(c, i);
            s += (i ? " " : "") + std::to_string(e.location) + ">" + std::to_string(e.target);
        }
        return s;
    }
    // What a text is stored as under the given flags.
    std::string stored(std::uint32_t flags, const char *text) {
        open(flags);
        EXPECT_EQ(StoreString(text), TPLEX_OK);
        const TableCheck &c = closed();
        return table_string(c, c.string_offset);
    }
};

TEST_F(ReferencesTest, Framing) {
    open(0, 3);
    WriteUInt8(1);
    std::fflush(output_stream.file);  // provisional header until the close
    EXPECT_EQ(hex(file().data(), 0, 17), "03 00 00 00 3c 00 00 00 3c 00 00 00 3c 00 00 00 01");
    ASSERT_EQ(AbandonOutput(0), TPLEX_OK);
    EXPECT_FALSE(exists());
    open();
    EXPECT_EQ(header(closed()), "1 16 16 60");  // tag 0 is written as 1
    open(0, 7);
    for (int i = 0; i < 5; ++i) WriteUInt8(0);
    const TableCheck &c = closed();
    EXPECT_EQ(header(c), "7 24 24 60");
    EXPECT_EQ(hex(c.table, 16, c.size), "00 00 00 00 00 3c 3c 3c");
    EXPECT_EQ(AbandonOutput(1), TPLEX_OUT_NOT_OPEN);  // after a close: frees nothing
    EXPECT_NE(table_output.relocatables, nullptr);
}

TEST_F(ReferencesTest, ForwardBackwardAndRepeatedUses) {
    open();
    std::uint32_t fwd = 0, back = 0;
    DefineReferenceHere(&back, 0, 0);  // 16
    WriteReference(&fwd, 0);           // use at 16
    WriteReference(nullptr, back);     // use at 20
    WriteReference(nullptr, fwd);      // use at 24
    WriteUInt8(0);
    DefineReferenceHere(nullptr, fwd, 1);  // 29: no alignment switch
    EXPECT_EQ(back * 10 + fwd, 12u);
    EXPECT_EQ(entries(closed()), "20>16 16>29 24>29");
}

TEST_F(ReferencesTest, StringTable) {
    open();
    StoreString("ab");
    StoreString("c");
    const TableCheck &c = closed();
    EXPECT_EQ(entries(c), "16>24 20>27");  // S and S + 3
    EXPECT_EQ(hex(c.table, 24, 32), "61 62 00 63 00 00 00 00");
    // A string that does not fit in the rest of a chunk starts the next one;
    // the table still holds the strings back to back.
    open();
    std::string first(9000, 'a'), second(1500, 'b');
    StoreString(first.c_str());
    StoreString(second.c_str());
    EXPECT_EQ(table_output.store.first->used, 9001u);
    EXPECT_NE(table_output.store.first->link, nullptr);
    const TableCheck &d = closed();
    EXPECT_EQ(entries(d), "16>24 20>9025");
    EXPECT_EQ(table_string(d, 9025), second);
    EXPECT_EQ(d.relocation_offset, 24u + 9001 + 1501 + 2);
}

TEST_F(ReferencesTest, Escapes) {
    EXPECT_EQ(stored(0, R"(a\"b\'c\nd)"), "a\"b'c\nd");
    EXPECT_EQ(stored(0, R"(\t\\x)"), "??x");
    EXPECT_EQ(stored(0, R"(ab\)"), "ab?");  // a lone final backslash
    EXPECT_EQ(stored(TPLEX_OUT_DROP_NEWLINES, R"(a\nb\")"), "ab\"");
    EXPECT_EQ(stored(TPLEX_OUT_LITERAL_BACKSLASH, R"(a\nb\\)"), R"(a\nb\\)");
    EXPECT_EQ(stored(0, "tab\there"), "tab\there");
}

TEST_F(ReferencesTest, TablesAreReusedAndFreed) {
    open();
    StoreString(std::string(9999, 'x').c_str());
    StoreString("y");
    ASSERT_EQ(CloseOutput(), TPLEX_OK);
    Relocatable *table = table_output.relocatables;
    open();
    EXPECT_EQ(table_output.relocatables, table);
    EXPECT_EQ(table_output.store.first->link, nullptr);
    EXPECT_EQ(AbandonOutput(1), TPLEX_OK);
    EXPECT_EQ(table_output.store.first, nullptr);
    // Without tables no id is handed out, and a string still finds room.
    std::uint32_t id = 9, position = 0;
    EXPECT_EQ(AllocateReference(&id), TPLEX_OUT_TOO_MANY_REFERENCES);
    EXPECT_EQ(AddToStringStore(&position, "z"), TPLEX_OK);
    EXPECT_EQ(id * 10 + position, 1u);
}

}  // namespace
}  // namespace tplex::test
