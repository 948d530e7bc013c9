// The platform layer on Windows: the C library's text mode already does
// what the lexer needs, so each operation passes straight through.
#include <climits>

#include "source/platform.h"

namespace tplex::platform {

std::FILE *open_source(const char *path) {
    if (path == nullptr) return nullptr;
    return std::fopen(path, "r");
}

int close_source(std::FILE *file) {
    if (file == nullptr) return 0;
    return std::fclose(file) != 0 ? 1 : 0;
}

// A capacity below 2 has no room for a character: nothing is read, as on a
// POSIX host. A read that gets nothing leaves the line as it was.
bool read_line(std::FILE *file, char *line, std::size_t capacity) {
    if (line == nullptr || capacity < 2 || file == nullptr) return false;
    const int size = capacity > INT_MAX ? INT_MAX : static_cast<int>(capacity);
    return std::fgets(line, size, file) != nullptr;
}

}  // namespace tplex::platform
