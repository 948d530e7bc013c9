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
        const table_check &c = closed();
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
    EXPECT_EQ(body(0, [] { WriteInt8(-3), WriteInt16(-2), WriteInt32(-1); }),
              "fd fe ff ff ff ff ff 3c");
    EXPECT_EQ(body(0, [] { WriteUInt8(1), AlignOutput(8), WriteUInt8(2); }),
              "01 3c 3c 3c 02 3c 3c 3c");
    EXPECT_EQ(body(0, [] { WriteUInt8(1), AlignOutput(2), WriteUInt8(2); }), "01 3c 02 3c");
}

TEST_F(StreamTest, Blocks) {
    const int cases[][3] = {{0, 0, 0},  {3, 0, 1},   {4, 0, 4}, {8, 0, 8},
                            {16, 0, 0}, {17, 0, 15}, {5, 3, 3}};  // n, skew, fill
    for (auto [n, skew, fill] : cases) EXPECT_EQ(block_fill(n, skew), fill) << n << "+" << skew;
    open();
    EXPECT_EQ(EndBlock(), TPLEX_OUT_NO_OPEN_BLOCK);
    for (int i = 0; i < 100; ++i) BeginBlock();
    EXPECT_EQ(BeginBlock(), TPLEX_OUT_TOO_MANY_BLOCKS);
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
    Bytes raw = table(0), text = table(TPLEX_OUT_HEX_TEXT);
    std::string expected;
    for (std::size_t i = 0; i < raw.size(); ++i) {
        char item[8];
        std::snprintf(item, sizeof item, " 0x%02x", raw[i]);
        // The line break is the host's text mode's: CR LF on Windows.
        expected += (i == 0 ? "" : i % 16 == 0 ? "," + std::string(host_line_end) : ",") + item;
    }
    EXPECT_EQ(std::string(text.begin(), text.end()), expected);
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
    open();  // never alongside a table file
    EXPECT_EQ(StartMemoryOutput(), TPLEX_OUT_CANNOT_OPEN);
}

}  // namespace
}  // namespace tplex::test
