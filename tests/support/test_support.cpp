#include "test_support.h"

#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <stdexcept>

#include <fcntl.h>
#include <unistd.h>

namespace fs = std::filesystem;

namespace tplex::test {

TempDir::TempDir() {
    std::string pattern = (fs::temp_directory_path() / "tplex-test-XXXXXX").string();
    if (mkdtemp(pattern.data()) == nullptr) throw std::runtime_error("mkdtemp failed");
    path_ = pattern;
}

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
    char name[] = "/tmp/tplex-stdout-XXXXXX";
    int fd = mkstemp(name);
    if (fd < 0) throw std::runtime_error("mkstemp failed");
    file_ = name;
    saved_fd_ = dup(1);
    dup2(fd, 1);
    close(fd);
}

CaptureStdout::~CaptureStdout() { text(); }

std::string CaptureStdout::text() {
    if (!done_) {
        std::fflush(stdout);
        dup2(saved_fd_, 1);
        close(saved_fd_);
        std::ifstream in(file_, std::ios::binary);
        captured_.assign(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
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
