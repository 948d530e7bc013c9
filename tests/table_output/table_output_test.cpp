// The table output module (the byte stream, references and strings, the
// file's framing, every failure with its message) and the table inspector.
#include "tplex/table_output.h"

#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <fstream>
#include <functional>
#include <iterator>
#include <list>
#include <string>
#include <vector>

#include "table_output/references.h"
#include "test_support.h"

namespace tplex::test {
namespace {

using Bytes = std::vector<std::uint8_t>;

// "3c 01 ff": bytes from..to as lower-case hex.
inline std::string hex(const std::uint8_t *b, std::size_t from, std::size_t to) {
    std::string s;
    char item[4];
    for (std::size_t i = from; i < to; ++i) {
        std::snprintf(item, sizeof item, s.empty() ? "%02x" : " %02x", b[i]);
        s += item;
    }
    return s;
}

class Output : public ::testing::Test {
protected:
    TempDir dir;
    std::string path = dir.path + "/out.tbl";

    // The block stack outlives an output: leave no block open for the next test.
    void TearDown() override {
        AbandonOutput(1), FreeOutputTables(), FreeMemoryOutput();
        while (EndBlock() != TPLEX_OUT_NO_OPEN_BLOCK) {
        }
        for (table_check &c : checks_) ReleaseTableCheck(&c);
    }
    void open(std::uint32_t flags = 0, std::uint32_t tag = 0) {
        ASSERT_EQ(OpenOutput(path.c_str(), flags, tag), TPLEX_OK);
    }
    Bytes file() const {
        std::ifstream in(path, std::ios::binary);
        return Bytes(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
    }
    bool exists() const { return access(path.c_str(), F_OK) == 0; }
    // Closes and returns the checked table (decoded from hex text if need
    // be), valid until the test ends.
    const table_check &closed() {
        EXPECT_EQ(CloseOutput(), TPLEX_OK);
        const Bytes &b = files_.emplace_back(file());
        table_check &c = checks_.emplace_back();
        EXPECT_TRUE(CheckTable(b.data(), b.size(), &c)) << c.error;
        return c;
    }
    // Writes into a fresh table; the body with its closing fill (offsets 16 to S).
    std::string body(std::uint32_t flags, const std::function<void()> &write) {
        open(flags);
        write();
        const table_check &c = closed();
        return hex(c.table, 16, c.string_offset);
    }
    // Fill bytes EndBlock adds to a block of n bytes starting skew bytes
    // past a multiple of 16.
    std::uint32_t block_fill(int n, int skew) {
        open();
        for (int i = 0; i < skew; ++i) WriteUInt8(1);
        BeginBlock();
        for (int i = 0; i < n; ++i) WriteUInt8(2);
        const std::uint32_t before = output_stream.offset;
        EXPECT_EQ(EndBlock(), TPLEX_OK);
        AbandonOutput(0);
        return output_stream.offset - before;
    }
    // "location>target" of every relocation entry, in file order.
    static std::string entries(const table_check &c) {
        std::string s;
        for (std::uint32_t i = 0; i < c.relocation_count; ++i) {
            table_relocation e = TableRelocationAt(&c, i);
            s += (i ? " " : "") + std::to_string(e.location) + ">" + std::to_string(e.target);
        }
        return s;
    }
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

private:
    std::list<Bytes> files_;
    std::list<table_check> checks_;
};

TEST_F(Output, WritersAlignmentAndBlocks) {
    const std::pair<std::function<void()>, const char *> raw[] = {
        {[] { WriteUInt8(1), WriteUInt32(0x05040302); }, "01 02 03 04 05 3c 3c 3c"},
        {[] { WriteInt8(-3), WriteInt16(-2), WriteInt32(-1); }, "fd fe ff ff ff ff ff 3c"},
        {[] { WriteUInt8(1), AlignOutput(8), WriteUInt8(2); }, "01 3c 3c 3c 02 3c 3c 3c"},
        {[] { WriteUInt8(1), AlignOutput(2), WriteUInt8(2); }, "01 3c 02 3c"}};
    for (const auto &[write, bytes] : raw) EXPECT_EQ(body(0, write), bytes);
    EXPECT_EQ(body(TPLEX_OUT_ALIGN, [] { WriteUInt8(1), WriteUInt16(0x0302); }), "01 3c 02 03");
    EXPECT_EQ(body(TPLEX_OUT_ALIGN, [] { WriteUInt8(1), WriteUInt32(0x05040302); }),
              "01 3c 3c 3c 02 03 04 05");
    const int blocks[][3] = {{0, 0, 0},  {3, 0, 1},   {4, 0, 4}, {8, 0, 8},
                             {16, 0, 0}, {17, 0, 15}, {5, 3, 3}};
    for (auto [n, skew, fill] : blocks) EXPECT_EQ(block_fill(n, skew), fill) << n << "+" << skew;
    open();
    EXPECT_EQ(EndBlock(), TPLEX_OUT_NO_OPEN_BLOCK);
    for (int i = 0; i < 100; ++i) BeginBlock();
    EXPECT_EQ(BeginBlock(), TPLEX_OUT_TOO_MANY_BLOCKS);
}

// Hex text: " 0x%02x" items, "," between them and a line break before every
// sixteenth; the header rewritten in place.
TEST_F(Output, HexText) {
    open(TPLEX_OUT_HEX_TEXT, 0x12345678);
    WriteUInt8(0xA0);
    ASSERT_EQ(CloseOutput(), TPLEX_OK);
    const Bytes text = file();
    EXPECT_EQ(std::string(text.begin(), text.end()),
              " 0x78, 0x56, 0x34, 0x12, 0x14, 0x00, 0x00, 0x00, 0x14, 0x00, 0x00, 0x00, 0x3c, "
              "0x00, 0x00, 0x00," +
                  std::string(host_line_end) + " 0xa0, 0x3c, 0x3c, 0x3c");
}

TEST_F(Output, MemoryOutputIsAStreamOfItsOwn) {
    ASSERT_EQ(StartMemoryOutput(), TPLEX_OK);
    WriteUInt8(1), WriteUInt32(0x05040302), AlignOutput(4), BeginBlock(), WriteUInt8(9), EndBlock();
    for (int i = 0; i < 20000; ++i) PutByte(static_cast<std::uint8_t>(i));  // three chunks
    StopMemoryOutput();
    EXPECT_EQ(PutByte(0), TPLEX_OUT_WRITE_FAILED);  // no file: goes nowhere
    Bytes image(MemoryOutputSize());
    ASSERT_EQ(CopyMemoryOutput(image.data(), 30000), 20012u);
    EXPECT_EQ(hex(image.data(), 0, 12), "01 02 03 04 05 3c 3c 3c 09 3c 3c 3c");
    EXPECT_EQ(image[12 + 10000] + image[20011], 10000 % 256 + 19999 % 256);
    open();  // never alongside a table file
    EXPECT_EQ(StartMemoryOutput(), TPLEX_OUT_CANNOT_OPEN);
}

// The provisional header until the close, then tag (0 written as 1),
// length, R and 60. Freeing the tables leaves an open output alone.
TEST_F(Output, FramingAndFreeingTheTables) {
    open(0, 3);
    WriteUInt8(1);
    std::fflush(output_stream.file);
    EXPECT_EQ(hex(file().data(), 0, 17), "03 00 00 00 3c 00 00 00 3c 00 00 00 3c 00 00 00 01");
    EXPECT_EQ(FreeOutputTables(), TPLEX_OK);
    WriteUInt8(2);
    ASSERT_EQ(CloseOutput(), TPLEX_OK);
    EXPECT_EQ(hex(file().data(), 0, 20),
              "03 00 00 00 14 00 00 00 14 00 00 00 3c 00 00 00 01 02 3c 3c");
    open(0, 0);
    for (int i = 0; i < 5; ++i) WriteUInt8(0);
    ASSERT_EQ(CloseOutput(), TPLEX_OK);
    EXPECT_EQ(hex(file().data(), 0, 24),
              "01 00 00 00 18 00 00 00 18 00 00 00 3c 00 00 00 00 00 00 00 00 3c 3c 3c");
    open();  // after a free: a string gets a new chunk, and no reference id is handed out
    FreeOutputTables();
    std::uint32_t position = 0;
    EXPECT_EQ(AddToStringStore(&position, "s"), TPLEX_OK);
    EXPECT_EQ(position, 1u);
    EXPECT_EQ(WriteReference(nullptr, 0), TPLEX_OUT_TOO_MANY_REFERENCES);
}

// Entries id by id, use by use; strings at S, S + 3 after 0x00 padding; a
// string that does not fit in the rest of a chunk starts the next one.
TEST_F(Output, ReferencesAndStrings) {
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
    open();
    StoreString(std::string(9000, 'a').c_str()), StoreString(std::string(1500, 'b').c_str());
    const table_check &c = closed();
    EXPECT_EQ(entries(c), "16>24 20>9025");
    EXPECT_EQ(TableStringAt(&c, 9025), std::string(1500, 'b'));
}

TEST_F(Output, Escapes) {
    const char *cases[][3] = {{"", R"(a\"b\'c\nd)", "a\"b'c\nd"},
                              {"", R"(\t\\x)", "??x"},
                              {"", R"(ab\)", "ab?"},  // a lone final backslash
                              {"d", R"(a\nb\")", "ab\""},
                              {"l", R"(a\nb\\)", R"(a\nb\\)"}};
    for (auto [flag, text, result] : cases) {
        open(*flag == 'd'   ? TPLEX_OUT_DROP_NEWLINES
             : *flag == 'l' ? TPLEX_OUT_LITERAL_BACKSLASH
                            : 0);
        EXPECT_EQ(StoreString(text), TPLEX_OK);
        const table_check &c = closed();
        EXPECT_STREQ(TableStringAt(&c, c.string_offset), result) << text;
    }
}

struct Failure {
    std::function<status_code()> run;  // on an open output
    status_code code;
    std::string message;  // on standard error, with diagnostics on
    bool closes;          // the file takes no further byte
};

// Each case with diagnostics on and off; the output is then abandoned,
// which deletes its file whether or not the failure closed it.
TEST_F(Output, FailureCodesAndMessages) {
    const std::string p = "sg_TableOutput: ", out_of_range = p + "relocatable out of range\n";
    std::uint32_t id = 0;
    const Failure cases[] = {
        {[&] {
             for (int i = 0; i < 50000; ++i) AllocateReference(&id);
             return id = 0, AllocateReference(&id);
         },
         TPLEX_OUT_TOO_MANY_REFERENCES,
         "sg_TableOutput (StoreString): Failed to allocate reference\n", true},
        {[] { return DefineReference(3, 20); }, TPLEX_OUT_BAD_TARGET_ID,
         p + "Illegal cross reference id 3\n", true},
        {[&] { return DefineReferenceHere(&id, 0, 0), DefineReference(id, 40); },
         TPLEX_OUT_DOUBLE_DEFINITION, p + "Double definition of reference 0\n", true},
        {[] { return CreateReference(0, 20); }, TPLEX_OUT_BAD_USE_ID,
         p + "Illegal cross reference id 0\n", true},
        {[] { return StoreString("s"), table_output.store.total += 3, CloseOutput(); },
         TPLEX_OUT_STRING_TABLE_DAMAGED, p + "String table integrity damaged\n", true},
        {[] { return DefineReferenceHere(nullptr, 0, 0), CloseOutput(); },
         TPLEX_OUT_UNUSED_REFERENCE, p + "relocatable with no references 0\n", true},
        {[] { return WriteReference(nullptr, 0), DefineReference(1, 0), CloseOutput(); },
         TPLEX_OUT_UNDEFINED_REFERENCE, p + "relocatable with no definition\n", true},
        {[&] { return DefineReferenceHere(&id, 0, 0), CreateReference(id, 9999), CloseOutput(); },
         TPLEX_OUT_OUT_OF_RANGE, out_of_range, true},
        {[&] {  // S + position - 1 must not wrap below R
             AllocateReference(&id), CreateReference(id, 16), WriteUInt32(0);
             return SetReferenceTarget(id, 0xFFFFFFF0u, 1), CloseOutput();
         },
         TPLEX_OUT_OUT_OF_RANGE, out_of_range, true},
        {EndBlock, TPLEX_OUT_NO_OPEN_BLOCK, "", false},
        // Refusals: nothing written, the output goes on.
        {[] { return StoreString(std::string(10000, 'x').c_str()); }, TPLEX_OUT_STRING_TOO_LONG,
         "sg_TableOutput (StoreString): String too long\n", false},
        {[this] {
             return OpenOutput((path + "2").c_str(),
                               output_stream.diagnostics ? TPLEX_OUT_DIAGNOSTICS : 0, 0);
         },
         TPLEX_OUT_CANNOT_OPEN, p + "can't open '" + path + "2'\n", false}};
    for (const Failure &f : cases) {
        for (std::uint32_t flags : {TPLEX_OUT_DIAGNOSTICS, 0u}) {
            SCOPED_TRACE(f.message + (flags ? " (diagnostics)" : ""));
            open(flags);
            Capture err(2);
            EXPECT_EQ(f.run(), f.code);
            EXPECT_EQ(err.text(), flags != 0 ? f.message : "");
            EXPECT_EQ(PutByte(0) == TPLEX_OUT_WRITE_FAILED, f.closes);
            EXPECT_EQ(AbandonOutput(1), TPLEX_OK);
            EXPECT_FALSE(exists());
        }
    }
    EXPECT_EQ(CloseOutput(), TPLEX_OUT_NOT_OPEN);
    EXPECT_EQ(OpenOutput(nullptr, 0, 0), TPLEX_OUT_CANNOT_OPEN);
}

// A failing write closes the file once and later bytes fail quietly; a
// full disk is never success. A failed seek is printed on standard output.
TEST_F(Output, WriteAndSeekFailures) {
#ifdef _WIN32
    GTEST_SKIP() << "no full device (/dev/full) nor unseekable file (a FIFO) on Windows";
#else
    if (access("/dev/full", W_OK) != 0) GTEST_SKIP() << "no /dev/full";
    {
        ASSERT_EQ(symlink("/dev/full", path.c_str()), 0);
        open(TPLEX_OUT_DIAGNOSTICS | TPLEX_OUT_HEX_TEXT);
        Capture err(2);
        status_code s = TPLEX_OK;
        for (int i = 0; i < (1 << 20) && s == TPLEX_OK; ++i) s = WriteUInt8(1);
        EXPECT_EQ(s, TPLEX_OUT_WRITE_FAILED);
        EXPECT_EQ(CloseOutput(), TPLEX_OUT_WRITE_FAILED);
        EXPECT_EQ(err.text(), "sg_TableOutput: Fatal erorr: Write byte error\n");
        EXPECT_EQ(AbandonOutput(0), TPLEX_OK);
    }
    ASSERT_EQ(symlink("/dev/full", path.c_str()), 0);
    open();  // a small table: only the final flush can fail
    EXPECT_EQ(CloseOutput(), TPLEX_OUT_WRITE_FAILED);
    AbandonOutput(0);
    ASSERT_EQ(mkfifo(path.c_str(), 0600), 0);
    open();  // no diagnostics
    Capture out;
    EXPECT_EQ(CloseOutput(), TPLEX_OUT_SEEK_FAILED);
    EXPECT_EQ(out.text(), "sg_TableOutput: File seek failed - error = -1\n");
#endif
}

Bytes set(Bytes b, std::size_t at, std::uint32_t v) {
    for (std::size_t i = 0; i < 4 && at + i < b.size(); ++i)
        b[at + i] = static_cast<std::uint8_t>(v >> 8 * i);
    return b;
}

TEST_F(Output, BrokenTables) {
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
        {set(b, 28, 0x63636363), "relocation 1: string at 28 has no terminator before 32"}};
    for (const auto &[bytes, error] : cases) EXPECT_EQ(error_of(bytes), error);
}

}  // namespace
}  // namespace tplex::test
