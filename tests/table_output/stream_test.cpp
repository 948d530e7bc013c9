// The byte stream: writers, alignment, blocks, hex text and memory output.
#include <functional>

#include "table_fixture.h"

namespace tplex::test {
namespace {

class StreamTest : public TableTest {
protected:
    // Writes into a fresh table; returns the body with its closing fill
    // (offsets 16 to S: the body starts at a multiple of 16).
    std::string body(std::uint32_t flags, const std::function<void()> &write) {
        open(flags);
        write();
        const TableCheck &c = closed();
        return hex(c.table, 16, c.string_offset);
    }
    // Fill bytes EndBlock adds to a block of n bytes starting `skew` bytes
    // past a multiple of 16.
    std::uint32_t block_fill(int n, int skew) {
        open();
        for (int i = 0; i < skew; ++i) WriteUInt8(1);
        BeginBlock();
        for (int i = 0; i < n; ++i) WriteUInt8(2);
        std::uint32_t before = output_stream.offset;
        EXPECT_EQ(EndBlock(), TPLEX_OK);
        AbandonOutput(0);
        return output_stream.offset - before;
    }
};

TEST_F(StreamTest, WritersAndAlignment) {
    EXPECT_EQ(body(0, [] { WriteUInt8(1), WriteUInt32(0x05040302); }), "01 02 03 04 05 3c 3c 3c");
    EXPECT_EQ(body(1, [] { WriteUInt8(1), WriteUInt16(0x0302); }), "01 3c 02 03");
    EXPECT_EQ(body(1, [] { WriteUInt8(1), WriteUInt32(0x05040302); }), "01 3c 3c 3c 02 03 04 05");
    EXPECT_EQ(body(1, [] { WriteUInt8(1), WriteUInt8(2), WriteInt8(-3); }), "01 02 fd 3c");
    EXPECT_EQ(body(0, [] { WriteInt16(-2), WriteInt32(-1); }), "fe ff ff ff ff ff 3c 3c");
    EXPECT_EQ(body(0, [] { WriteUInt8(1), AlignOutput(8), WriteUInt8(2); }),
              "01 3c 3c 3c 02 3c 3c 3c");
    EXPECT_EQ(body(0, [] { WriteUInt8(1), AlignOutput(0), WriteUInt8(2); }),
              "01 3c 3c 3c 02 3c 3c 3c");
    EXPECT_EQ(body(0, [] { WriteUInt8(1), AlignOutput(2), WriteUInt8(2); }), "01 3c 02 3c");
    EXPECT_EQ(body(0, [] { WriteUInt16(1), AlignOutput(2), WriteUInt8(2); }), "01 00 02 3c");
}

TEST_F(StreamTest, Blocks) {
    EXPECT_EQ(block_fill(0, 0), 0u);
    EXPECT_EQ(block_fill(3, 0), 1u);
    EXPECT_EQ(block_fill(4, 0), 4u);
    EXPECT_EQ(block_fill(8, 0), 8u);
    EXPECT_EQ(block_fill(16, 0), 0u);
    EXPECT_EQ(block_fill(17, 0), 15u);
    EXPECT_EQ(block_fill(5, 3), 3u);  // measured from the block's start
    open();
    EXPECT_EQ(EndBlock(), TPLEX_OUT_NO_OPEN_BLOCK);
    for (int i = 0; i < 100; ++i) BeginBlock();
    EXPECT_EQ(BeginBlock(), TPLEX_OUT_TOO_MANY_BLOCKS);
    AbandonOutput(0);
    open();  // blocks are the caller's to balance: a new output keeps them
    EXPECT_EQ(BeginBlock(), TPLEX_OUT_TOO_MANY_BLOCKS);
    for (int i = 0; i < 100; ++i) EXPECT_EQ(EndBlock(), TPLEX_OK);
    EXPECT_EQ(EndBlock(), TPLEX_OUT_NO_OPEN_BLOCK);
}

// Hex text holds exactly the raw bytes: " 0x%02x" items, "," between them
// and a line break before every sixteenth; the header rewritten in place.
TEST_F(StreamTest, HexTextMatchesRawBytes) {
    auto table = [&](std::uint32_t flags) {
        open(flags, 0x12345678);
        for (int i = 0; i < 21; ++i) WriteUInt8(static_cast<std::uint8_t>(0xA0 + i));
        StoreString("hex");
        EXPECT_EQ(CloseOutput(), TPLEX_OK);
        return file();
    };
    Bytes raw = table(0), hex_text = table(TPLEX_OUT_HEX_TEXT);
    std::string expected, text(hex_text.begin(), hex_text.end());
    for (std::size_t i = 0; i < raw.size(); ++i) {
        char item[8];
        std::snprintf(item, sizeof item, " 0x%02x", raw[i]);
        // The line break is the host's text mode's: CR LF on Windows.
        expected += (i == 0        ? ""
                     : i % 16 == 0 ? "," + std::string(host_line_end)
                                   : ",") +
                    std::string(item);
    }
    EXPECT_EQ(text, expected);
    // Tag, length 56, R 48; the 17th byte starts line 2.
    EXPECT_EQ(text.substr(0, 53), " 0x78, 0x56, 0x34, 0x12, 0x38, 0x00, 0x00, 0x00, 0x30");
    EXPECT_EQ(text.substr(95, 6 + sizeof host_line_end - 1),
              "," + std::string(host_line_end) + " 0xa0");
}

TEST_F(StreamTest, MemoryOutputIsAStreamOfItsOwn) {
    ASSERT_EQ(StartMemoryOutput(), TPLEX_OK);
    WriteUInt8(1), WriteUInt32(0x05040302), AlignOutput(4), BeginBlock(), WriteUInt8(9), EndBlock();
    for (int i = 0; i < 20000; ++i) PutByte(static_cast<std::uint8_t>(i));  // three chunks
    StopMemoryOutput();
    EXPECT_EQ(PutByte(0), TPLEX_OUT_WRITE_FAILED);  // no file: goes nowhere
    Bytes image(MemoryOutputSize());
    ASSERT_EQ(CopyMemoryOutput(image.data(), 30000), 20012u);
    EXPECT_EQ(hex(image.data(), 0, 12), "01 02 03 04 05 3c 3c 3c 09 3c 3c 3c");
    EXPECT_EQ(image[12 + 10000] + image[20011], 10000 % 256 + 19999 % 256);
    // Never alongside a table file; OpenOutput ends it.
    open();
    EXPECT_EQ(StartMemoryOutput(), TPLEX_OUT_CANNOT_OPEN);
    EXPECT_EQ(CloseOutput(), TPLEX_OK);
    EXPECT_EQ(file().size(), 16u);
    FreeMemoryOutput();
    EXPECT_EQ(CopyMemoryOutput(image.data(), 5), 0u);
}

}  // namespace
}  // namespace tplex::test
