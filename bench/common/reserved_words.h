/*
 * The 118 reserved words of the language, upper case, indexed by their code.
 * Shared by the corpus generator and the flex peer (the re2c peer spells them
 * as rules of its own).
 */
#ifndef BENCH_RESERVED_WORDS_H
#define BENCH_RESERVED_WORDS_H

#define BENCH_RESERVED_WORD_COUNT 118

static const char *const bench_reserved_words[BENCH_RESERVED_WORD_COUNT] = {
    "PROTOCOL",
    "PROCESS",
    "STATE",
    "NEXTSTATE",
    "INPUT", /*   0 */
    "UNDEFINED",
    "OUTPUT",
    "ALL",
    "INT",
    "BIT", /*   5 */
    "NIBBLE",
    "BYTE",
    "TEMPLATE",
    "TYPE",
    "MESSAGE", /*  10 */
    "MATCH",
    "GENERATE",
    "BLOCK",
    "SIGNAL",
    "SIGNALROUTE", /*  15 */
    "CONNECT",
    "ENDBLOCK",
    "START",
    "DCL",
    "ENDPROCESS", /*  20 */
    "ENDSTATE",
    "FROM",
    "ENV",
    "TO",
    "WITH", /*  25 */
    "TASK",
    "VIA",
    "AND",
    "BOOL",
    "STOP", /*  30 */
    "UINT",
    "UBYTE",
    "OR",
    "NOT",
    "<=", /*  35 */
    ">=",
    "/=",
    "TRUE",
    "FALSE",
    "XOR", /*  40 */
    "DECISION",
    "ELSE",
    "ENDDECISION",
    "INMSG",
    "SEQUENCEVALIDITY", /* 45 */
    "VALID",
    "INVALID",
    "UNKNOWN",
    "RECORDNUMBER",
    "PREVIOUSINSEQ", /* 50 */
    "SELECTCODE",
    "CHARSTRING",
    "NOCREATE",
    "PROCESSKEY",
    "JOIN", /*  55 */
    "LINK",
    "UNLINK",
    "PID",
    "SELF",
    "PARENT", /*  60 */
    "OFFSPRING",
    "SENDER",
    "SET",
    "ACTIVE",
    "RESET", /*  65 */
    "TIMER",
    "OUTMSG",
    "USE",
    "STANDARD",
    "TIME", /*  70 */
    "DURATION",
    "NOW",
    "TIMESTAMP",
    "EVENTTYPE",
    "EVENTSTATUS", /*  75 */
    "LENGTH",
    "JAN",
    "FEB",
    "MAR",
    "APR", /*  80 */
    "MAY",
    "JUN",
    "JUL",
    "AUG",
    "SEP", /*  85 */
    "OCT",
    "NOV",
    "DEC",
    "SYSTEM",
    "CHANNELROUTE", /*  90 */
    "CONTROL",
    "LOG",
    "STREAM",
    "USERINTERFACE",
    "ENDCHANNELROUTE", /* 95 */
    "REFERENCED",
    "IN",
    "ON",
    "PC",
    "DASS", /* 100 */
    "ENDSYSTEM",
    "CALLTRACEID",
    "DYNAMIC",
    "STATIC",
    "FIELD", /* 105 */
    "VALUE",
    "POSITION",
    "MASK",
    "CRC",
    "PROTECT", /* 110 */
    "SOURCE",
    "HEADER",
    "WINDOW" /* 115 */
};

#endif /* BENCH_RESERVED_WORDS_H */
