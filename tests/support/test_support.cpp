#include "test_support.h"

#include <fcntl.h>

#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <stdexcept>
#ifdef _WIN32
#include <io.h>
#include <sys/stat.h>
#else
#include <unistd.h>
#endif

namespace fs = std::filesystem;

namespace tplex::test {

namespace {

#ifdef _WIN32
// The C runtime's names for the POSIX descriptor calls.
int dup(int fd) {
    return _dup(fd);
}
int dup2(int from, int to) {
    return _dup2(from, to);
}
int close(int fd) {
    return _close(fd);
}

// _mktemp_s picks a name that does not exist yet; creating it can still
// lose a race with another process, so try again a few times.
std::string make_temp_dir(const std::string &pattern) {
    for (int attempt = 0; attempt < 100; ++attempt) {
        std::string name = pattern;
        if (_mktemp_s(name.data(), name.size() + 1) != 0) break;
        std::error_code ec;
        if (fs::create_directory(name, ec)) return name;
    }
    throw std::runtime_error("cannot create a temporary folder");
}

// Binary mode: captured text is what the library wrote, without the CR
// that text mode would put before each line feed on the console.
int make_temp_file(std::string &name) {
    for (int attempt = 0; attempt < 100; ++attempt) {
        std::string candidate = name;
        if (_mktemp_s(candidate.data(), candidate.size() + 1) != 0) break;
        int fd = _open(candidate.c_str(), _O_CREAT | _O_EXCL | _O_RDWR | _O_BINARY,
                       _S_IREAD | _S_IWRITE);
        if (fd >= 0) {
            name = candidate;
            return fd;
        }
    }
    return -1;
}
#else
std::string make_temp_dir(std::string pattern) {
    if (mkdtemp(pattern.data()) == nullptr) throw std::runtime_error("mkdtemp failed");
    return pattern;
}

int make_temp_file(std::string &name) {
    return mkstemp(name.data());
}
#endif

}  // namespace

TempDir::TempDir()
    : path_(make_temp_dir((fs::temp_directory_path() / "tplex-test-XXXXXX").string())) {}

TempDir::~TempDir() {
    std::error_code ec;
    fs::remove_all(path_, ec);
}

std::string TempDir::write(const std::string &name, const std::string &bytes) const {
    fs::path full = fs::path(path_) / name;
    fs::create_directories(full.parent_path());
    std::ofstream out(full, std::ios::binary);
    out.write(bytes.data(), static_cast<std::streamsize>(bytes.size()));
    return full.string();
}

std::string TempDir::mkdir(const std::string &name) const {
    fs::path full = fs::path(path_) / name;
    fs::create_directories(full);
    return full.string();
}

CaptureStdout::CaptureStdout() {
    std::fflush(stdout);
    file_ = (fs::temp_directory_path() / "tplex-stdout-XXXXXX").string();
    int fd = make_temp_file(file_);
    if (fd < 0) throw std::runtime_error("cannot create a capture file");
    saved_fd_ = dup(1);
    dup2(fd, 1);
    close(fd);
}

CaptureStdout::~CaptureStdout() {
    text();
}

std::string CaptureStdout::text() {
    if (!done_) {
        std::fflush(stdout);
        dup2(saved_fd_, 1);
        close(saved_fd_);
        std::ifstream in(file_, std::ios::binary);
        captured_.assign(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
        in.close();
        std::remove(file_.c_str());
        done_ = true;
    }
    return captured_;
}

ChangeDir::ChangeDir(const std::string &dir) : saved_(fs::current_path().string()) {
    fs::current_path(dir);
}

ChangeDir::~ChangeDir() {
    std::error_code ec;
    fs::current_path(saved_, ec);
}

}  // namespace tplex::test
