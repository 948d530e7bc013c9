#include "test_support.h"

#include <fcntl.h>

#include <cstdio>
#include <filesystem>
#include <fstream>
#include <stdexcept>
#ifdef _WIN32
#include <io.h>
#include <sys/stat.h>
#define dup _dup
#define dup2 _dup2
#define close _close
#else
#include <unistd.h>
#endif

namespace fs = std::filesystem;

namespace tplex::test {

namespace {

// A name from the pattern that did not exist yet; creating it may still lose
// a race with another process, so try again a few times.
#ifdef _WIN32
std::string make_temp_dir(const std::string &pattern) {
    for (int attempt = 0; attempt < 100; ++attempt) {
        std::string name = pattern;
        std::error_code ec;
        if (_mktemp_s(name.data(), name.size() + 1) == 0 && fs::create_directory(name, ec))
            return name;
    }
    throw std::runtime_error("cannot create a temporary folder");
}

// Binary: the captured text is what was written, without text mode's CRs.
int make_temp_file(std::string &name) {
    for (int attempt = 0; attempt < 100; ++attempt) {
        std::string candidate = name;
        if (_mktemp_s(candidate.data(), candidate.size() + 1) != 0) break;
        int fd = _open(candidate.c_str(), _O_CREAT | _O_EXCL | _O_RDWR | _O_BINARY,
                       _S_IREAD | _S_IWRITE);
        if (fd >= 0) return name = candidate, fd;
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
    std::ofstream(full, std::ios::binary).write(bytes.data(), std::streamsize(bytes.size()));
    return full.string();
}

Capture::Capture(int fd) : fd_(fd) {
    std::fflush(fd == 1 ? stdout : stderr);
    file_ = (fs::temp_directory_path() / "tplex-capture-XXXXXX").string();
    int out = make_temp_file(file_);
    if (out < 0) throw std::runtime_error("cannot create a capture file");
    saved_ = dup(fd);
    dup2(out, fd);
    close(out);
}

Capture::~Capture() {
    text();
}

std::string Capture::text() {
    if (done_) return captured_;
    std::fflush(fd_ == 1 ? stdout : stderr);
    dup2(saved_, fd_);
    close(saved_);
    {
        std::ifstream in(file_, std::ios::binary);
        captured_.assign(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
    }
    std::remove(file_.c_str());
    done_ = true;
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
