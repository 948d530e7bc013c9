// What every fuzz harness needs around the library: a private working
// folder, a quiet standard output, a snapshot of the open descriptors, and
// a check that stops the run with a message when an invariant breaks.
//
// The harnesses are plain C++17 so the regression tests (built with any
// compiler) can replay the same inputs through the same code.
#ifndef TPLEX_FUZZ_HARNESS_SUPPORT_H
#define TPLEX_FUZZ_HARNESS_SUPPORT_H

#include <cstddef>
#include <cstdint>
#include <string>

namespace tplex::fuzz {

// Reports a broken invariant on standard error and aborts, which the fuzzer
// records as a finding and a test as a crash.
[[noreturn]] void fail(const char *what, const char *file, int line, long long detail);

#define TPLEX_FUZZ_CHECK(cond, detail)                                                    \
    do {                                                                                  \
        if (!(cond)) ::tplex::fuzz::fail(#cond, __FILE__, __LINE__, (long long)(detail)); \
    } while (0)

// Once per process: makes a fresh folder (under /dev/shm when there is one)
// and removes it at exit. Returns the folder's path.
const std::string &work_dir();

// Sends standard output to /dev/null and takes standard input from it (the
// library's listing reads keys): the fuzzers call it once at start.
void silence_stdio();

// The working folder is the current directory while the object lives, so
// relative names (#include "inc.src") reach the run's files; the fuzzer's
// own relative paths work again afterwards.
class in_work_dir {
public:
    in_work_dir();
    ~in_work_dir();
    in_work_dir(const in_work_dir &) = delete;
    in_work_dir &operator=(const in_work_dir &) = delete;

private:
    int saved_ = -1;
};

// Writes bytes to a file in the current folder, replacing it.
void write_file(const char *name, const std::uint8_t *data, std::size_t size);

// The set of open descriptors among the first 256, as a bitmap.
struct fd_set_snapshot {
    std::uint64_t bits[4] = {0, 0, 0, 0};
    bool operator==(const fd_set_snapshot &o) const;
};
fd_set_snapshot open_fds();

// True for a value the library may return: any result (0 or more), or one
// of its failure codes (0xD347xxxx, 0xD3431001).
bool is_status(std::int32_t r);

// True when the field holds a NUL within its size.
bool terminated(const char *field, std::size_t size);

// Splits an input at the record separator byte 0x1E into at most n parts;
// the last part takes the rest.
struct part {
    const std::uint8_t *data;
    std::size_t size;
};
void split_input(const std::uint8_t *data, std::size_t size, part *parts, int n);

// Reads script bytes one at a time; zero when they run out.
class script_reader {
public:
    script_reader(const std::uint8_t *data, std::size_t size) : p_(data), end_(data + size) {}
    bool done() const { return p_ >= end_; }
    std::uint8_t byte() { return p_ < end_ ? *p_++ : 0; }
    std::uint16_t u16() {
        const std::uint16_t lo = byte();
        return static_cast<std::uint16_t>(lo | (byte() << 8));
    }
    std::uint32_t u32() {
        const std::uint32_t lo = u16();
        return lo | (static_cast<std::uint32_t>(u16()) << 16);
    }
    // Up to n bytes as text (stopping early at the end of the script).
    std::string text(std::size_t n) {
        std::string s;
        while (n-- > 0 && p_ < end_) s.push_back(static_cast<char>(*p_++));
        return s;
    }

private:
    const std::uint8_t *p_;
    const std::uint8_t *end_;
};

}  // namespace tplex::fuzz

#endif
