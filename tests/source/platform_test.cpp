// Text-mode reading on the host: CR LF, 0x1A, the line limit and the
// boundaries of the 32 KiB blocks the reader works in, against a reference
// that applies text mode a character at a time.
#include "source/platform.h"

#include <gtest/gtest.h>

#include <cstdio>
#include <cstring>
#include <random>
#include <string>
#include <vector>

#include "test_support.h"

namespace tplex {
namespace {

using Lines = std::vector<std::string>;
constexpr std::size_t block = 32 * 1024;

// Every line of a stream; a filler byte behind each line gives its length,
// so NUL bytes inside a line count as well.
Lines read_all(std::FILE *file, std::size_t capacity) {
    Lines lines;
    std::vector<char> buf(capacity + 1);
    for (;;) {
        std::memset(buf.data(), '\xEE', buf.size());
        if (!platform::read_line(file, buf.data(), capacity)) break;
        const std::size_t len = std::string(buf.data(), buf.size()).find('\xEE') - 1;
        EXPECT_LT(len, capacity);
        lines.emplace_back(buf.data(), len);
    }
    EXPECT_FALSE(platform::read_line(file, buf.data(), capacity));  // the end stays the end
    return lines;
}

Lines lines_of(const std::string &bytes, std::size_t capacity = 5000) {
    test::TempDir tmp;
    std::FILE *file = platform::open_source(tmp.write("f.src", bytes).c_str());
    EXPECT_NE(file, nullptr);
    Lines lines = read_all(file, capacity);
    EXPECT_EQ(platform::close_source(file), 0);
    return lines;
}

Lines reference_lines(const std::string &bytes, std::size_t capacity) {
    Lines lines;
    std::string line;
    for (std::size_t i = 0; i < bytes.size() && bytes[i] != '\x1A'; ++i) {
        if (bytes[i] == '\r' && i + 1 < bytes.size() && bytes[i + 1] == '\n') continue;
        line += bytes[i];
        if (bytes[i] == '\n' || line.size() == capacity - 1) lines.push_back(line), line.clear();
    }
    if (!line.empty()) lines.push_back(line);
    return lines;
}

TEST(TextMode, AgreesWithTheCharacterAtATimeReference) {
    const std::string x(block - 1, 'x');
    std::vector<std::string> inputs = {"a\nb\n",
                                       "a\r\nb\r\n",
                                       "a\rb\n",
                                       "a\r\r\n\r",
                                       "\n\n",
                                       "last",
                                       "",
                                       std::string("a\0b\n\0", 5),
                                       "a\x1A"
                                       "b\n",
                                       "\x1A"
                                       "b\n",
                                       "a\n\x1A\nb\x1A",
                                       "a\r\x1A\n",
                                       "abcdef\n",
                                       "abc\r\nd",
                                       x + "\r\ny\r\n",
                                       x + "\rz\n",
                                       x + "\r",
                                       x + "\r\x1A\n",
                                       x + "\x1A"
                                           "after",
                                       x + "y\x1A"
                                           "after",
                                       x + "\r\n" + std::string(block - 2, 'w') + "\r\nend",
                                       std::string(3 * block + 17, 'l') + "\ntail"};
    std::mt19937 rng(20240611);
    for (int round = 0; round < 12; ++round) {
        std::string bytes(2 * block + rng() % block, 'a');
        for (char &c : bytes) c = "ab\r\n\r\n\r"[rng() % 7];
        if (round % 2 == 0) bytes[block - 8 + rng() % (block / 2)] = '\x1A';
        inputs.push_back(bytes);
    }
    for (std::size_t i = 0; i < inputs.size(); ++i)
        for (std::size_t cap :
             {std::size_t{2}, std::size_t{4}, std::size_t{7}, std::size_t{5000}, 3 * block})
            EXPECT_EQ(lines_of(inputs[i], cap), reference_lines(inputs[i], cap))
                << "input " << i << ", capacity " << cap;
    EXPECT_EQ(lines_of("a\r\nb\r\n"), (Lines{"a\n", "b\n"}));  // the reference itself, spelled out
    EXPECT_EQ(lines_of("abc\r\nd", 4), (Lines{"abc", "\n", "d"}));
}

TEST(TextMode, StreamsNotOpenedHereAndPaths) {
    test::TempDir tmp;
#ifndef _WIN32
    // On Windows text mode belongs to the C runtime and is chosen at opening.
    std::FILE *binary = std::fopen(tmp.write("b",
                                             "a\r\nb\rc\x1A"
                                             "d\n")
                                       .c_str(),
                                   "rb");
    EXPECT_EQ(read_all(binary, 5000), (Lines{"a\n", "b\rc"}));
    std::fclose(binary);
#endif
    char line[8] = "x";
    EXPECT_FALSE(platform::read_line(nullptr, line, sizeof line));
    EXPECT_STREQ(line, "x") << "a read that gets nothing leaves the line as it was";
    tmp.write("d/f.src", "f\n");
    std::FILE *file = platform::open_source((tmp.path() + "\\d\\f.src").c_str());
    ASSERT_NE(file, nullptr);
    EXPECT_EQ(read_all(file, 100), (Lines{"f\n"}));
    EXPECT_EQ(platform::close_source(file), 0);
    EXPECT_EQ(platform::open_source(tmp.path().c_str()), nullptr);  // a directory
#ifndef _WIN32
    // The POSIX layer's own read slots: 24, and free again after a close.
    std::vector<std::FILE *> open;
    const std::string path = tmp.path() + "/d/f.src";
    while (std::FILE *f = platform::open_source(path.c_str())) open.push_back(f);
    EXPECT_EQ(open.size(), 24u);
    EXPECT_EQ(platform::close_source(open.back()), 0);
    open.back() = platform::open_source(path.c_str());
    EXPECT_NE(open.back(), nullptr);
    for (std::FILE *f : open) EXPECT_EQ(platform::close_source(f), 0);
#endif
    // A stream closed behind the layer's back: a new one at its address reads its own bytes.
    std::FILE *closed = platform::open_source(tmp.write("c.src", "first\nsecond\n").c_str());
    EXPECT_TRUE(platform::read_line(closed, line, 3));
    std::fclose(closed);
    file = platform::open_source(tmp.write("o.src", "other\n").c_str());
    EXPECT_EQ(read_all(file, 100), (Lines{"other\n"}));
    EXPECT_EQ(platform::close_source(file), 0);
}

}  // namespace
}  // namespace tplex
