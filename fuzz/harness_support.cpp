#include "harness_support.h"

#include <fcntl.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <filesystem>

namespace tplex::fuzz {

void fail(const char *what, const char *file, int line, long long detail) {
    std::fprintf(stderr, "\n*** invariant broken: %s (%s:%d, detail %lld = 0x%llx)\n", what, file,
                 line, detail, static_cast<unsigned long long>(detail));
    std::fflush(stderr);
    std::abort();
}

namespace {

std::string folder;

void remove_folder() {
    std::error_code ec;
    if (!folder.empty()) std::filesystem::remove_all(folder, ec);
}

void redirect(int fd, int flags) {
    const int null_fd = ::open("/dev/null", flags);
    if (null_fd < 0) return;
    ::dup2(null_fd, fd);
    ::close(null_fd);
}

}  // namespace

const std::string &work_dir() {
    if (!folder.empty()) return folder;
    const char *base = ::access("/dev/shm", W_OK) == 0 ? "/dev/shm" : "/tmp";
    std::string pattern = std::string(base) + "/tplex-fuzz-XXXXXX";
    if (::mkdtemp(pattern.data()) == nullptr) fail("mkdtemp", __FILE__, __LINE__, errno);
    folder = pattern;
    std::atexit(remove_folder);
    return folder;
}

void silence_stdio() {
    std::fflush(stdout);
    redirect(1, O_WRONLY);
    redirect(0, O_RDONLY);
}

in_work_dir::in_work_dir() : saved_(::open(".", O_RDONLY | O_DIRECTORY | O_CLOEXEC)) {
    if (saved_ < 0 || ::chdir(work_dir().c_str()) != 0) fail("chdir", __FILE__, __LINE__, errno);
}

in_work_dir::~in_work_dir() {
    if (::fchdir(saved_) != 0) fail("fchdir", __FILE__, __LINE__, errno);
    ::close(saved_);
}

void write_file(const char *name, const std::uint8_t *data, std::size_t size) {
    const int fd = ::open(name, O_WRONLY | O_CREAT | O_TRUNC, 0600);
    if (fd < 0) fail("open for writing", __FILE__, __LINE__, errno);
    while (size > 0) {
        const ssize_t n = ::write(fd, data, size);
        if (n <= 0) fail("write", __FILE__, __LINE__, errno);
        data += n;
        size -= static_cast<std::size_t>(n);
    }
    ::close(fd);
}

bool fd_set_snapshot::operator==(const fd_set_snapshot &o) const {
    return std::memcmp(bits, o.bits, sizeof bits) == 0;
}

fd_set_snapshot open_fds() {
    fd_set_snapshot s;
    for (int fd = 0; fd < 256; ++fd)
        if (::fcntl(fd, F_GETFD) != -1) s.bits[fd / 64] |= std::uint64_t{1} << (fd % 64);
    return s;
}

bool is_status(std::int32_t r) {
    const auto u = static_cast<std::uint32_t>(r);
    return r >= 0 || (u & 0xFFFF0000u) == 0xD3470000u || u == 0xD3431001u;
}

bool terminated(const char *field, std::size_t size) {
    return std::memchr(field, 0, size) != nullptr;
}

void split_input(const std::uint8_t *data, std::size_t size, part *parts, int n) {
    for (int i = 0; i < n; ++i) parts[i] = {data + size, 0};
    for (int i = 0; i < n; ++i) {
        const void *sep = i + 1 < n ? std::memchr(data, 0x1E, size) : nullptr;
        const std::size_t len =
            sep != nullptr ? static_cast<std::size_t>(static_cast<const std::uint8_t *>(sep) - data)
                           : size;
        parts[i] = {data, len};
        if (sep == nullptr) return;
        data += len + 1;
        size -= len + 1;
    }
}

}  // namespace tplex::fuzz
