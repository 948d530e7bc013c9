// The table output module (the byte stream, references and strings, the
// file's framing, every failure with its message) and the table checker.
#include "tplex/table_output.h"

#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <fstream>
#include <functional>
#include <iterator>
#include <string>
#include <tuple>
#include <vector>

#include "table_output/references.h"
#include "test_support.h"

namespace tplex::test {
namespace {

using Bytes = std::vector<std::uint8_t>;

// "3c 01 ff": bytes from..to as lower-case hex.
std::string hex(const std::uint8_t *b, std::size_t from, std::size_t to) {
    std::string s;
    char item[4];
    for (std::size_t i = from; i < to; ++i)
        s += (std::snprintf(item, sizeof item, " %02x", b[i]), item);
    return s.substr(s.empty() ? 0 : 1);
}

class Output : public ::testing::Test {
protected:
    TempDir dir;
    std::string path = dir.path + "/out.tbl";
    Bytes last;  // the table closed() checked

    // The block stack outlives an output: a new memory output empties it.
    void TearDown() override {
        AbandonOutput(1), FreeOutputTables(), StartMemoryOutput(), FreeMemoryOutput();
    }
    void open(std::uint32_t flags = 0, std::uint32_t tag = 0) {
        ASSERT_EQ(OpenOutput(path.c_str(), flags, tag), TPLEX_OK);
    }
    Bytes file() const {
        std::ifstream in(path, std::ios::binary);
        return Bytes(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
    }
    // Closes and checks the (raw) table, valid until the next call.
    table_check closed() {
        EXPECT_EQ(CloseOutput(), TPLEX_OK);
        last = file();
        table_check c{};
        EXPECT_TRUE(CheckTable(last.data(), last.size(), &c)) << c.error;
        return c;
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

// The body after the header as hex, then "|" and its first string: values
// lowest byte first, 0x3C fills for alignment and at the body's end, escapes.
TEST_F(Output, BodiesAndEscapes) {
    const std::uint32_t A = TPLEX_OUT_ALIGN, D = TPLEX_OUT_DROP_NEWLINES;
    const std::tuple<std::uint32_t, std::function<void()>, const char *> cases[] = {
        {0, [] { WriteUInt8(1), WriteUInt32(0x05040302); }, "01 02 03 04 05 3c 3c 3c|"},
        {0, [] { WriteInt8(-3), WriteInt16(-2), WriteInt32(-1); }, "fd fe ff ff ff ff ff 3c|"},
        {0, [] { WriteUInt8(1), AlignOutput(2), WriteUInt8(2), AlignOutput(8), WriteUInt8(3); },
         "01 3c 02 3c 03 3c 3c 3c|"},
        {A, [] { WriteUInt8(1), WriteUInt16(0x0302), WriteUInt8(4), WriteUInt32(0x08070605); },
         "01 3c 02 03 04 3c 3c 3c 05 06 07 08|"},
        {0, [] { StoreString(R"(a\"b\'c\nd)"); }, "4b 4b 4b 4b|a\"b'c\nd"},
        {0, [] { StoreString(R"(\t\\x)"); }, "4b 4b 4b 4b|??x"},
        {0, [] { StoreString(R"(ab\)"); }, "4b 4b 4b 4b|ab?"},  // a lone final backslash
        {D, [] { StoreString(R"(a\nb\")"); }, "4b 4b 4b 4b|ab\""},
        {TPLEX_OUT_LITERAL_BACKSLASH, [] { StoreString(R"(a\nb\\)"); }, R"(4b 4b 4b 4b|a\nb\\)"}};
    for (const auto &[flags, write, layout] : cases) {
        open(flags), write();
        const table_check c = closed();
        const char *string = c.string_count != 0 ? TableStringAt(&c, c.string_offset) : "";
        EXPECT_EQ(hex(c.table, 16, c.string_offset) + "|" + string, layout);
    }
}

// Blocks fill from their start; memory output is a stream of its own, in chunks.
TEST_F(Output, MemoryOutputAndBlocks) {
    const int blocks[][3] = {{0, 0, 0}, {3, 0, 1}, {4, 0, 4}, {8, 0, 8}, {17, 0, 15}, {5, 3, 3}};
    for (auto [n, skew, fill] : blocks) {
        StartMemoryOutput();
        for (int i = 0; i < skew; ++i) PutByte(1);
        BeginBlock();
        for (int i = 0; i < n; ++i) PutByte(2);
        EXPECT_EQ(EndBlock(), TPLEX_OK);
        EXPECT_EQ(MemoryOutputSize(), unsigned(skew + n + fill)) << n << "+" << skew;
    }
    for (int i = 0; i < 100; ++i) BeginBlock();
    EXPECT_EQ(BeginBlock(), TPLEX_OUT_TOO_MANY_BLOCKS);
    ASSERT_EQ(StartMemoryOutput(), TPLEX_OK);
    Bytes written;  // three chunks
    for (int i = 0; i < 20005; ++i) written.push_back(i & 255), WriteUInt8(written.back());
    StopMemoryOutput();
    EXPECT_EQ(PutByte(0), TPLEX_OUT_WRITE_FAILED);  // no file: goes nowhere
    Bytes image(30000);
    image.resize(CopyMemoryOutput(image.data(), 30000));
    EXPECT_EQ(image, written);
    open();  // never beside a table file
    EXPECT_EQ(StartMemoryOutput(), TPLEX_OUT_CANNOT_OPEN);
}

// Hex text, sixteen items a line, its header (tag 0 as 1) rewritten in place;
// freeing the tables leaves the output open, and a string gets a new chunk.
TEST_F(Output, HexTextFramingAndFreeingTheTables) {
    open(TPLEX_OUT_HEX_TEXT, 0);
    WriteUInt8(1), FreeOutputTables(), AddToStringStore(nullptr, "s"), WriteUInt8(2);
    ASSERT_EQ(CloseOutput(), TPLEX_OK);
    const Bytes text = file();
    EXPECT_EQ(std::string(text.begin(), text.end()),
              " 0x01, 0x00, 0x00, 0x00, 0x18, 0x00, 0x00, 0x00, 0x18, 0x00, 0x00, 0x00, 0x3c, "
              "0x00, 0x00, 0x00," +
                  std::string(host_line_end) + " 0x01, 0x02, 0x3c, 0x3c, 0x73, 0x00, 0x00, 0x00");
    EXPECT_EQ(WriteReference(nullptr, 0), TPLEX_OUT_TOO_MANY_REFERENCES);  // no table, no id
}

// Entries id by id, use by use; strings padded with 0x00; one string per chunk.
TEST_F(Output, ReferencesAndStrings) {
    open();
    std::uint32_t fwd = 0, back = 0;
    DefineReferenceHere(&back, 0, 0), WriteReference(&fwd, 0);  // back is 16, fwd used at 16
    WriteReference(nullptr, back), WriteReference(nullptr, fwd), WriteUInt8(0);  // 20, 24; 28
    DefineReferenceHere(nullptr, fwd, 1);  // 29: no alignment switch
    StoreString("ab"), StoreString("c");   // uses at 29, 33
    const table_check t = closed();
    EXPECT_EQ(entries(t), "20>16 16>29 24>29 29>40 33>43");
    EXPECT_EQ(hex(t.table, 37, 48), "3c 3c 3c 61 62 00 63 00 00 00 00");
    open();
    StoreString(std::string(9000, 'a').c_str()), StoreString(std::string(1500, 'b').c_str());
    const table_check c = closed();
    EXPECT_EQ(entries(c), "16>24 20>9025");
}

// A call on an open output: its code, message (diagnostics on), and whether it closes the file.
TEST_F(Output, FailureCodesAndMessages) {
    const std::string p = "sg_TableOutput: ", out_of_range = p + "Relocatable out of range\n";
    std::uint32_t id = 0, diagnostics = TPLEX_OUT_DIAGNOSTICS;
    // clang-format off
    const std::tuple<std::function<status_code()>, status_code, std::string, bool> cases[] = {
        {[&] { for (int i = 0; i < 50000; ++i) AllocateReference(&id);
               return AllocateReference(&id); }, TPLEX_OUT_TOO_MANY_REFERENCES,
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
         TPLEX_OUT_UNUSED_REFERENCE, p + "Relocatable with no references 0\n", true},
        {[] { return WriteReference(nullptr, 0), DefineReference(1, 0), CloseOutput(); },
         TPLEX_OUT_UNDEFINED_REFERENCE, p + "Relocatable with no definition\n", true},
        {[&] { return DefineReferenceHere(&id, 0, 0), CreateReference(id, 9999), CloseOutput(); },
         TPLEX_OUT_OUT_OF_RANGE, out_of_range, true},
        {[&] { AllocateReference(&id), CreateReference(id, 16), WriteUInt32(0);  // no wrap below R
               return SetReferenceTarget(id, 0xFFFFFFF0u, 1), CloseOutput(); },
         TPLEX_OUT_OUT_OF_RANGE, out_of_range, true},
        // Refusals: nothing written, the output goes on.
        {EndBlock, TPLEX_OUT_NO_OPEN_BLOCK, "", false},
        {[] { return StoreString(std::string(10000, 'x').c_str()); }, TPLEX_OUT_STRING_TOO_LONG,
         "sg_TableOutput (StoreString): String too long\n", false},
        {[&] { return OpenOutput(path.c_str(), output_stream.diagnostics ? diagnostics : 0, 0); },
         TPLEX_OUT_CANNOT_OPEN, p + "can't open '" + path + "'\n", false}};
    // clang-format on
    for (const auto &[run, code, message, closes] : cases) {
        for (std::uint32_t flags : {diagnostics, 0u}) {
            SCOPED_TRACE(message + (flags ? " (diagnostics)" : ""));
            open(flags);
            Capture err(2);
            EXPECT_EQ(run(), code);
            EXPECT_EQ(err.text(), flags != 0 ? message : "");
            EXPECT_EQ(PutByte(0) == TPLEX_OUT_WRITE_FAILED, closes);
            EXPECT_EQ(AbandonOutput(1), TPLEX_OK);
        }
    }
    EXPECT_EQ(CloseOutput(), TPLEX_OUT_NOT_OPEN);
    EXPECT_EQ(OpenOutput(nullptr, 0, 0), TPLEX_OUT_CANNOT_OPEN);
}

// A full disk is never success, reported once; a failed seek goes to standard output.
#ifndef _WIN32  // no full device (/dev/full) nor unseekable file (a FIFO) on Windows
TEST_F(Output, WriteAndSeekFailures) {
    if (access("/dev/full", W_OK) != 0) GTEST_SKIP() << "no /dev/full";
    ASSERT_EQ(symlink("/dev/full", path.c_str()), 0);
    open();  // a small table: only the final flush can fail
    EXPECT_EQ(CloseOutput(), TPLEX_OUT_WRITE_FAILED);
    open(TPLEX_OUT_DIAGNOSTICS | TPLEX_OUT_HEX_TEXT);  // replaces the failed output
    Capture err(2);
    status_code s = TPLEX_OK;
    for (int i = 0; i < (1 << 20) && s == TPLEX_OK; ++i) s = WriteUInt8(1);
    EXPECT_EQ(s, TPLEX_OUT_WRITE_FAILED);
    EXPECT_EQ(CloseOutput(), TPLEX_OUT_WRITE_FAILED);
    EXPECT_EQ(err.text(), "sg_TableOutput: Fatal erorr: Write byte error\n");
    EXPECT_EQ(AbandonOutput(0), TPLEX_OK);
    ASSERT_EQ(mkfifo(path.c_str(), 0600), 0);
    open();  // no diagnostics
    Capture out;
    EXPECT_EQ(CloseOutput(), TPLEX_OUT_SEEK_FAILED);
    EXPECT_EQ(out.text(), "sg_TableOutput: File seek failed - error = -1\n");
}
#endif

Bytes set(Bytes b, std::size_t at, std::uint32_t v) {
    for (std::size_t i = 0; i < 4 && at + i < b.size(); ++i)
        b[at + i] = static_cast<std::uint8_t>(v >> 8 * i);
    return b;
}

// The checker's finding on a sound table (16>20, 24>28 "ab"; R 32) with a word changed.
TEST_F(Output, BrokenTables) {
    open();
    WriteReference(nullptr, 0), DefineReference(1, 20), WriteUInt32(0), StoreString("ab");
    std::fflush(output_stream.file);
    const Bytes unfinished = file();  // the header as it is until the close
    ASSERT_EQ(CloseOutput(), TPLEX_OK);
    const Bytes b = file();
    const std::pair<Bytes, const char *> cases[] = {
        {set(b, 12, 61), "header word at offset 12 is 61, not 60"},
        {unfinished, "unfinished table: the header still holds 60 for length and relocations"},
        {set(b, 4, 44), "header says 44 bytes, the table holds 48"},
        {set(b, 8, 30), "relocation table offset 30 does not fit a table of 48 bytes"},
        {set(b, 32, 30), "relocation 0: location 30 lies outside offsets 16 to 28"},
        {set(b, 36, 32), "relocation 0: target 32 is not below the relocation table at 32"},
        {set(b, 16, 7), "relocation 0: location 16 holds 0x00000007, not a placeholder"},
        {set(set(b, 32, 24), 36, 29), "relocation 0: target 29 is not the start of a string"},
        {set(b, 28, 0x63636363), "relocation 1: string at 28 has no terminator before 32"}};
    for (const auto &[bytes, error] : cases) {
        table_check c{};
        EXPECT_FALSE(CheckTable(bytes.data(), bytes.size(), &c));
        EXPECT_STREQ(c.error, error);
        ReleaseTableCheck(&c);
    }
}

}  // namespace
}  // namespace tplex::test
