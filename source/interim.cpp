// Interim source stack, platform layer and messages: just enough for the
// lexer to link and run while the full subsystems are being built.
#include <cstdio>
#include <cstring>
#include "source/source_stack.h"
#include "source/platform.h"
#include "errors/messages.h"
#include "lex/lexer.h"
#include "scan/char_source.h"
namespace tplex {
source_frame *source_stack = nullptr;
int16_t source_depth = 0;
char include_dirs[include_dir_entries][include_dir_size];
int32_t include_dir_count = 0;
bool is_absolute_path(const char *) { return false; }
status_code open_source_file(const char *name) {
  if (!name) return TPLEX_NULL_FILENAME;
  if (!source_stack) return TPLEX_NOT_INITIALISED;
  char_source_sync();
  if (source_depth == 19) return TPLEX_TOO_MANY_INCLUDE_LEVELS;
  ++source_depth; source_frame &f = source_stack[source_depth]; f.read_pos=0; f.line_no=0xFFFFFFFFu;
  f.file = platform::open_source(name);
  if (!f.file) { --source_depth; return TPLEX_NO_INCLUDE_DIRS; }
  std::snprintf(f.path, sizeof f.path, "%s", name);
  return source_depth;
}
status_code close_sources() { char_source_sync(); status_code r=0; if(!source_stack) return 0; for (int d=19; d>=1; --d) if (source_stack[d].file) { if (platform::close_source(source_stack[d].file)) r = TPLEX_CLOSE_FAILED; source_stack[d].file=nullptr;} return r; }
status_code rewind_input() { if(!source_stack) return TPLEX_NOT_INITIALISED; lex_reset(); char p[200]; std::strcpy(p, source_stack[1].path); close_sources(); return open_source_file(p); }
status_code add_include_dir(const char *) { return 0; }
namespace platform {
std::FILE *open_source(const char *path) { return std::fopen(path, "r"); }
int close_source(std::FILE *f) { return std::fclose(f); }
bool read_line(std::FILE *f, char *line, std::size_t cap) { if (!f) return false; return std::fgets(line, (int)cap, f) != nullptr; }
}
const char *status_text(status_code) { return nullptr; }
void display_error(status_code c) { std::printf("error %x\n", (unsigned)c); }
const char *get_error(status_code) { return "x"; }
}
