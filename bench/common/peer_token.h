/*
 * The token record of the two peer scanners: the same shape of hand-over as
 * the library's shared record (kind, value, text filled in place), plus the
 * text length that a scanner knows anyway.
 */
#ifndef BENCH_PEER_TOKEN_H
#define BENCH_PEER_TOKEN_H

#include <stddef.h>
#include <stdint.h>

#define PEER_TEXT_SIZE 2500 /* strings keep 2499 characters */
#define PEER_WORD_MAX 128   /* words and numbers keep 128 */

enum peer_kind {
    peer_number = 1,
    peer_string = 2,
    peer_operator = 3,
    peer_end = 5,
    peer_reserved = 9,
    peer_identifier = 10,
    peer_pdf = 33,
    peer_char = 34,
    peer_bad = -1 /* a character that starts no token */
};

typedef struct peer_token {
    uint16_t kind;
    int32_t value;
    size_t len;
    char text[PEER_TEXT_SIZE];
} peer_token;

#endif /* BENCH_PEER_TOKEN_H */
