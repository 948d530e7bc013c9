// The table output module: the byte stream, references and strings, the
// file's framing, and every failure with its message.
#include <sys/stat.h>

#include <functional>
#include <string>

#include "table_fixture.h"

namespace tplex::test {
namespace {

class Output : public TableTest {
protected:
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
};

TEST_F(Output, WritersAlignmentAndBlocks) {
    const std::pair<std::function<void()>, const char *> raw[] = {
        {[] { WriteUInt8(1), WriteUInt32(0x05040302); }, "01 02 03 04 05 3c 3c 3c"},
        {[] { WriteInt8(-3), WriteInt16(-2), WriteInt32(-1); }, "fd fe ff ff ff ff ff 3c"},
        {[] { WriteUInt8(1), AlignOutput(8), WriteUInt8(2); }, "01 3c 3c 3c 02 3c 3c 3c"},
        {[] { WriteUInt8(1), AlignOutput(2), WriteUInt8(2); }, "01 3c 02 3c"},
    };
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

// Hex text holds exactly the raw bytes: " 0x%02x" items, "," between them
// and a line break before every sixteenth; the header rewritten in place.
TEST_F(Output, HexTextMatchesRawBytes) {
    auto table = [&](std::uint32_t flags) {
        open(flags, 0x12345678);
        for (int i = 0; i < 21; ++i) WriteUInt8(static_cast<std::uint8_t>(0xA0 + i));
        StoreString("hex");
        EXPECT_EQ(CloseOutput(), TPLEX_OK);
        return file();
    };
    Bytes raw = table(0), text = table(TPLEX_OUT_HEX_TEXT);
    std::string expected;
    for (std::size_t i = 0; i < raw.size(); ++i) {
        char item[8];
        std::snprintf(item, sizeof item, " 0x%02x", raw[i]);
        expected += (i == 0 ? "" : i % 16 == 0 ? "," + std::string(host_line_end) : ",") + item;
    }
    EXPECT_EQ(std::string(text.begin(), text.end()), expected);
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
         TPLEX_OUT_CANNOT_OPEN, p + "can't open '" + path + "2'\n", false},
    };
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
    for (const std::string &name : {dir.path() + "/missing/t", std::string(200, 'n')}) {
        Capture err(2);
        EXPECT_EQ(OpenOutput(name.c_str(), TPLEX_OUT_DIAGNOSTICS, 0), TPLEX_OUT_CANNOT_OPEN);
        EXPECT_EQ(err.text(), "sg_TableOutput: can't open '" + name + "'\n");
        EXPECT_EQ(AbandonOutput(0), TPLEX_OUT_NOT_OPEN);
    }
    EXPECT_EQ(OpenOutput(nullptr, 0, 0), TPLEX_OUT_CANNOT_OPEN);
    path = dir.path() + "/" + std::string(199 - dir.path().size() - 1, 'n');  // 199 characters
    open();
}

// A failing write closes the file once and later bytes fail quietly; a
// full disk is never success. A failed seek is printed on standard output.
TEST_F(Output, WriteAndSeekFailures) {
#ifdef _WIN32
    GTEST_SKIP() << "no full device (/dev/full) nor unseekable file (a FIFO) on Windows";
#else
    if (access("/dev/full", W_OK) != 0) GTEST_SKIP() << "no /dev/full";
    for (std::uint32_t flags : {0u, TPLEX_OUT_HEX_TEXT}) {
        ASSERT_EQ(symlink("/dev/full", path.c_str()), 0);
        open(TPLEX_OUT_DIAGNOSTICS | flags);
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

}  // namespace
}  // namespace tplex::test
