// The parser services of tplex/services.h: each hands its call to the
// subsystem that owns it (the file name rules, plain C functions already,
// are defined in services/file_names.cpp). In the static archive only: nothing here is
// exported from the shared library.
#include "tplex/services.h"

#include "dict/listing.h"
#include "errors/messages.h"
#include "scan/pass_facts.h"
#include "services/declarations.h"
#include "services/string_arg.h"
#include "source/source_stack.h"

extern "C" {

status_code add_include_dir(const char *dir) {
    return tplex::add_include_dir(dir);
}

status_code make_label(uint16_t number, int16_t code, uint8_t mode) {
    return tplex::make_label(number, code, mode);
}

status_code parse_string(char *out, uint8_t mode) {
    return tplex::parse_string(out, mode);
}

void dict_list(uint8_t all) {
    tplex::dict_list(all);
}

void tplex_dict_list(uint8_t all, int pause) {
    tplex::list_dictionary(all, pause != 0);
}

int32_t tplex_open_regions(tplex_place *places, int32_t capacity) {
    return tplex::open_regions(places, capacity);
}

uint32_t tplex_comments_past_file_end(tplex_place *ended, uint32_t *opened_line) {
    return tplex::comments_past_file_end(ended, opened_line);
}

size_t sg_FormatError(status_code code, char *buffer, size_t size) {
    return tplex::format_diagnostic(code, buffer, size);
}

}  // extern "C"
