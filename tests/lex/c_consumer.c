/* A parser's view of the library: plain C, the public header, the shared
 * library. Drives one pass and checks what it sees through the addresses
 * that sc_lex_setup hands out. */
#include <stdio.h>
#include <string.h>

#include "tplex/lexer.h"

static int failures = 0;

#define CHECK(c)                                               \
    do {                                                       \
        if (!(c)) {                                            \
            fprintf(stderr, "%s:%d: %s\n", __FILE__, __LINE__, #c); \
            ++failures;                                        \
        }                                                      \
    } while (0)

int main(int argc, char **argv) {
    token_record *tok = NULL;
    source_frame *frames = NULL;
    int16_t *depth = NULL;
    reserved_word_record *words = NULL;
    uint8_t *declare = NULL;
    static const int kinds[] = {tk_reserved_word, tk_new_identifier, tk_reserved_word,
                                tk_new_identifier, tk_number, tk_operator, tk_reserved_word};
    int i;

    if (argc != 2) return 2;
    CHECK(sc_lex_init() == 0);
    CHECK(sc_lex_setup(&tok, &frames, &depth, &words, &declare) == 0);
    CHECK(tok != NULL && frames != NULL && depth != NULL && words != NULL && declare != NULL);
    CHECK(tok->kind == tk_hash_word && tok->value == hw_include && tok->slot == 210);
    CHECK(strcmp(tok->text, "INCLUDE") == 0);
    CHECK(words[117].code == 117 && strcmp(words[117].word, "WINDOW") == 0);
    CHECK(strcmp(((const char *)words) + 39 * 2502 + 2, "<=") == 0);
    CHECK(*declare == 1);

    CHECK(sc_lex_init_file(argv[1]) == 1);
    CHECK(*depth == 1 && frames[1].file != NULL && strcmp(frames[1].path, argv[1]) == 0);
    for (i = 0; i < (int)(sizeof kinds / sizeof kinds[0]); ++i) {
        status_code r = sc_next_token();
        CHECK(r == kinds[i]);
        CHECK(tok->kind == kinds[i]);
    }
    CHECK(tok->value == 24); /* ENDPROCESS */
    CHECK(frames[1].line_no == 2);
    CHECK(sc_next_token() == tk_end_of_input);
    CHECK(dict_check() == 0);
    CHECK(sg_closesources() == 0);
    CHECK(lex_free() == 0);
    if (failures == 0) printf("c_consumer: all checks passed\n");
    return failures == 0 ? 0 : 1;
}
