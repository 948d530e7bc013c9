// Text-mode reading on the host: CR LF, 0x1A, the line limit and the
// boundaries of the 32 KiB blocks the reader works in.
#include "source/platform.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <vector>

#include "test_support.h"

namespace tplex {
namespace {

constexpr std::size_t block = 32 * 1024;
test::TempDir tmp;

// Every line of a stream joined by "|" (a filler byte behind each line
// gives its length, NUL bytes included).
std::string read_all(std::FILE *file, std::size_t capacity, int (*close)(std::FILE *) = nullptr) {
    std::string lines;
    std::vector<char> buf(capacity + 1);
    for (std::string sep;; sep = "|") {
        std::memset(buf.data(), '\xEE', buf.size());
        if (!platform::read_line(file, buf.data(), capacity)) break;
        lines += sep + std::string(buf.begin(), std::find(buf.begin(), buf.end(), '\xEE') - 1);
    }
    EXPECT_FALSE(platform::read_line(file, buf.data(), capacity));  // the end stays the end
    EXPECT_EQ(buf[0], '\xEE') << "a read that gets nothing leaves the line as it was";
    EXPECT_EQ(close == nullptr ? 0 : close(file), 0);
    return lines;
}

// The lines of a file opened here, by a path written with "\".
std::string lines_of(const std::string &bytes, std::size_t cap = 3 * block,
                     const char *name = "f") {
    std::string path = tmp.write(name, bytes);
    std::replace(path.begin() + tmp.path.size(), path.end(), '/', '\\');
    return read_all(platform::open_source(path.c_str()), cap, platform::close_source);
}

// Also: streams not opened here are read a byte at a time; 24 read slots; a
// stream closed behind the layer's back leaves no stale bytes.
TEST(TextMode, Lines) {
    const std::string x(block - 1, 'x'), w(block - 2, 'w'), l(3 * block, 'l');
    // clang-format off
    const std::vector<std::pair<std::string, std::string>> cases = {
        {"a\r\nb\r\n", "a\n|b\n"}, {"a\r\r\n\r", "a\r\n|\r"}, {"last", "last"}, {"", ""},
        {std::string("a\0b\n\0", 5), std::string("a\0b\n|\0", 6)}, {"a\x1Az\n", "a"},
        {"a\n\x1A\nb\x1A", "a\n"}, {l + "\nt", l.substr(1) + "|l\n|t"} /* longer than 3 blocks */,
        // Across the end of the first block.
        {x + "\r\ny\r\n", x + "\n|y\n"}, {x + "\rz\n", x + "\rz\n"}, {x + "\r", x + "\r"},
        {x + "\r\x1A\n", x + "\r"}, {x + "\x1Azz", x}, {x + "y\x1Azz", x + "y"},
        {x + "\r\n" + w + "\r\nend", x + "\n|" + w + "\n|end"}};
    // clang-format on
    for (const auto &[in, out] : cases) EXPECT_EQ(lines_of(in), out) << in.substr(0, 20);
    // At most capacity - 1 characters a line.
    EXPECT_EQ(lines_of("abcdef\n", 4) + lines_of("ab\r\nd", 2), "abc|def|\na|b|\n|d");
    EXPECT_EQ(read_all(nullptr, 8), "");
#ifndef _WIN32  // on Windows text mode belongs to the C runtime, and so do the streams
    const std::string b = tmp.write("b", "a\r\nb\rc\x1Az\n");
    EXPECT_EQ(read_all(std::fopen(b.c_str(), "rb"), 5000, std::fclose), "a\n|b\rc");
    std::vector<std::FILE *> open;
    while (std::FILE *f = platform::open_source(b.c_str())) open.push_back(f);
    EXPECT_EQ(open.size(), 24u);
    EXPECT_EQ(platform::close_source(open.back()), 0);
    EXPECT_NE(open.back() = platform::open_source(b.c_str()), nullptr);
    for (std::FILE *f : open) EXPECT_EQ(platform::close_source(f), 0);
#endif
    std::FILE *closed = platform::open_source(tmp.write("d/c", "first\nsecond\n").c_str());
    EXPECT_TRUE(platform::read_line(closed, std::string(3, ' ').data(), 3));
    std::fclose(closed);
    EXPECT_EQ(lines_of("first\nsecond\n", 100, "d/c"), "first\n|second\n");
}

}  // namespace
}  // namespace tplex
