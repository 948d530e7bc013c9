// File framing, references and the string store.
#include <string>

#include "table_fixture.h"

namespace tplex::test {
namespace {

class ReferencesTest : public TableTest {
protected:
    // "location>target" of every relocation entry, in file order.
    static std::string entries(const table_check &c) {
        std::string s;
        for (std::uint32_t i = 0; i < c.relocation_count; ++i) {
            table_relocation e = TableRelocationAt(&c, i);
            s += (i ? " " : "") + std::to_string(e.location) + ">" + std::to_string(e.target);
        }
        return s;
    }
    // What a text is stored as under the given flags.
    std::string stored(std::uint32_t flags, const char *text) {
        open(flags);
        EXPECT_EQ(StoreString(text), TPLEX_OK);
        const table_check &c = closed();
        return TableStringAt(&c, c.string_offset);
    }
};

// The provisional header until the close, then tag (0 written as 1),
// length, R and 60; the body filled to a multiple of 4.
TEST_F(ReferencesTest, Framing) {
    open(0, 3);
    WriteUInt8(1);
    std::fflush(output_stream.file);
    EXPECT_EQ(hex(file().data(), 0, 17), "03 00 00 00 3c 00 00 00 3c 00 00 00 3c 00 00 00 01");
    ASSERT_EQ(AbandonOutput(0), TPLEX_OK);
    EXPECT_FALSE(exists());
    open(0, 0);
    for (int i = 0; i < 5; ++i) WriteUInt8(0);
    ASSERT_EQ(CloseOutput(), TPLEX_OK);
    EXPECT_EQ(hex(file().data(), 0, 24),
              "01 00 00 00 18 00 00 00 18 00 00 00 3c 00 00 00 00 00 00 00 00 3c 3c 3c");
}

// Freeing the tables leaves an open output alone: it closes whole. What is
// made after the free cannot reach the freed tables: a string gets a new
// chunk, and with no table no reference id is handed out.
TEST_F(ReferencesTest, FreeingTheTablesLeavesTheOutputOpen) {
    open(0, 3);
    WriteUInt8(1);
    EXPECT_EQ(FreeOutputTables(), TPLEX_OK);
    WriteUInt8(2);
    ASSERT_EQ(CloseOutput(), TPLEX_OK);
    EXPECT_EQ(hex(file().data(), 0, 20),
              "03 00 00 00 14 00 00 00 14 00 00 00 3c 00 00 00 01 02 3c 3c");
    EXPECT_EQ(file().size(), 20u);
    open();
    FreeOutputTables();
    std::uint32_t position = 0;
    EXPECT_EQ(AddToStringStore(&position, "s"), TPLEX_OK);
    EXPECT_EQ(position, 1u);
    EXPECT_EQ(WriteReference(nullptr, 0), TPLEX_OUT_TOO_MANY_REFERENCES);
}

// Entries id by id, use by use; strings at S, S + 3 after 0x00 padding.
TEST_F(ReferencesTest, EntriesAndStrings) {
    open();
    std::uint32_t fwd = 0, back = 0;
    DefineReferenceHere(&back, 0, 0);      // 16
    WriteReference(&fwd, 0);               // use at 16
    WriteReference(nullptr, back);         // use at 20
    WriteReference(nullptr, fwd);          // use at 24
    WriteUInt8(0);                         // 28
    DefineReferenceHere(nullptr, fwd, 1);  // 29: no alignment switch
    StoreString("ab"), StoreString("c");   // uses at 29, 33
    EXPECT_EQ(entries(closed()), "20>16 16>29 24>29 29>40 33>43");
    EXPECT_EQ(hex(file().data(), 37, 48), "3c 3c 3c 61 62 00 63 00 00 00 00");
}

// A string that does not fit in the rest of a chunk starts the next one;
// the table still holds the strings back to back.
TEST_F(ReferencesTest, StringsSpillIntoAFurtherChunk) {
    open();
    std::string first(9000, 'a'), second(1500, 'b');
    StoreString(first.c_str()), StoreString(second.c_str());
    EXPECT_NE(table_output.store.first->link, nullptr);
    const table_check &c = closed();
    EXPECT_EQ(entries(c), "16>24 20>9025");
    EXPECT_EQ(TableStringAt(&c, 9025), second);
}

TEST_F(ReferencesTest, Escapes) {
    const char *cases[][3] = {{"", R"(a\"b\'c\nd)", "a\"b'c\nd"},
                              {"", R"(\t\\x)", "??x"},
                              {"", R"(ab\)", "ab?"},  // a lone final backslash
                              {"", "tab\there", "tab\there"},
                              {"d", R"(a\nb\")", "ab\""},
                              {"l", R"(a\nb\\)", R"(a\nb\\)"}};
    for (auto [flag, text, result] : cases) {
        std::uint32_t flags = *flag == 'd'   ? TPLEX_OUT_DROP_NEWLINES
                              : *flag == 'l' ? TPLEX_OUT_LITERAL_BACKSLASH
                                             : 0;
        EXPECT_EQ(stored(flags, text), result) << text;
    }
}

}  // namespace
}  // namespace tplex::test
