// Text-mode reading on the host: CR LF, 0x1A, the line limit and the
// boundaries of the 32 KiB blocks the reader works in.
#include "source/platform.h"

#include <gtest/gtest.h>

#include <cstdio>
#include <cstring>
#include <string>
#include <vector>

#include "test_support.h"

namespace tplex {
namespace {

constexpr std::size_t block = 32 * 1024;

// Every line of a stream joined by "|"; a filler byte behind each line gives
// its length, so NUL bytes inside a line count as well.
std::string read_all(std::FILE *file, std::size_t capacity) {
    std::string lines;
    std::vector<char> buf(capacity + 1);
    for (int n = 0;; ++n) {
        std::memset(buf.data(), '\xEE', buf.size());
        if (!platform::read_line(file, buf.data(), capacity)) break;
        lines += (n ? "|" : "") +
                 std::string(buf.data(), std::string(buf.data(), buf.size()).find('\xEE') - 1);
    }
    EXPECT_FALSE(platform::read_line(file, buf.data(), capacity));  // the end stays the end
    return lines;
}

std::string lines_of(const std::string &bytes, std::size_t capacity = 3 * block) {
    test::TempDir tmp;
    std::FILE *file = platform::open_source(tmp.write("f.src", bytes).c_str());
    EXPECT_NE(file, nullptr);
    std::string lines = read_all(file, capacity);
    EXPECT_EQ(platform::close_source(file), 0);
    return lines;
}

TEST(TextMode, Lines) {
    const std::string x(block - 1, 'x'), w(block - 2, 'w'), l(3 * block + 17, 'l');
    // clang-format off
    const std::vector<std::pair<std::string, std::string>> cases = {
        {"a\r\nb\r\n", "a\n|b\n"}, {"a\rb\n", "a\rb\n"}, {"a\r\r\n\r", "a\r\n|\r"}, {"last", "last"},
        {"", ""}, {std::string("a\0b\n\0", 5), std::string("a\0b\n|\0", 6)}, {"a\x1Az\n", "a"},
        {"\x1Az\n", ""}, {"a\n\x1A\nb\x1A", "a\n"}, {"a\r\x1A\n", "a\r"},
        // Across the end of the first block.
        {x + "\r\ny\r\n", x + "\n|y\n"}, {x + "\rz\n", x + "\rz\n"}, {x + "\r", x + "\r"},
        {x + "\r\x1A\n", x + "\r"}, {x + "\x1Azz", x}, {x + "y\x1Azz", x + "y"},
        {x + "\r\n" + w + "\r\nend", x + "\n|" + w + "\n|end"}};
    // clang-format on
    for (const auto &[bytes, lines] : cases)
        EXPECT_EQ(lines_of(bytes), lines) << bytes.substr(0, 20);
    // At most capacity - 1 characters a line.
    EXPECT_EQ(lines_of("abcdef\n", 4), "abc|def|\n");
    EXPECT_EQ(lines_of("abc\r\nd", 4), "abc|\n|d");
    EXPECT_EQ(lines_of("ab\r\n", 2), "a|b|\n");
    EXPECT_EQ(lines_of(l + "\ntail", 3 * block),
              l.substr(0, 3 * block - 1) + "|" + l.substr(0, 18) + "\n|tail");
}

// Streams not opened here are read a byte at a time; a stream closed behind
// the layer's back leaves no stale bytes; 24 read slots; paths with "\".
TEST(TextMode, StreamsNotOpenedHereAndPaths) {
    test::TempDir tmp;
    char line[8] = "x";
    EXPECT_FALSE(platform::read_line(nullptr, line, sizeof line));
    EXPECT_STREQ(line, "x") << "a read that gets nothing leaves the line as it was";
    EXPECT_EQ(platform::open_source(tmp.path.c_str()), nullptr);  // a directory
#ifndef _WIN32  // on Windows text mode belongs to the C runtime, and so do the streams
    std::FILE *binary = std::fopen(tmp.write("b", "a\r\nb\rc\x1Az\n").c_str(), "rb");
    EXPECT_EQ(read_all(binary, 5000), "a\n|b\rc");
    std::fclose(binary);
    std::vector<std::FILE *> open;
    while (std::FILE *f = platform::open_source((tmp.path + "/b").c_str())) open.push_back(f);
    EXPECT_EQ(open.size(), 24u);
    EXPECT_EQ(platform::close_source(open.back()), 0);
    EXPECT_NE(open.back() = platform::open_source((tmp.path + "/b").c_str()), nullptr);
    for (std::FILE *f : open) EXPECT_EQ(platform::close_source(f), 0);
#endif
    std::FILE *closed = platform::open_source(tmp.write("d/c.src", "first\nsecond\n").c_str());
    EXPECT_TRUE(platform::read_line(closed, line, 3));
    std::fclose(closed);
    std::FILE *file = platform::open_source((tmp.path + "\\d\\c.src").c_str());
    EXPECT_EQ(read_all(file, 100), "first\n|second\n");
    EXPECT_EQ(platform::close_source(file), 0);
}

}  // namespace
}  // namespace tplex
