/*
 * failures.tpl: one of each failure that the lexer reports while it reads a
 * source, each under a comment that names it. The lexer reads on after
 * every failure, so one run shows them all:
 *
 *   tplex tokens failures.tpl      (run in this folder, with no -I)
 *
 * The parser's own failures (an identifier declared twice, used with the
 * wrong class, or never declared) come from parse_ident and dict_check as
 * the parser declares names; the text alone cannot show them.
 */

PROTOCOL Failures
{
    /* Bad Character: "$" starts no token. */
    FIELD Price$ : UINT;

    /* Digit Bad or Incompatible with Number Base: 9 is no binary digit. */
    FIELD Flags : BYTE MASK 0b1019;

    /* Bad PDF String: a double quote inside a PDF string is doubled, or
       ends the string together with ">". */
    HEADER <"Version "beta>;

    /* End of Line in Character: the byte after the quote below is 0xFF,
       which the lexer reads as the end of all input. */
    FIELD Fill : BYTE VALUE 'ÿ;
}

/* Too Many CONST Include Levels: a name whose body is the name itself
   expands twenty bodies deep, and the twenty-first fails. */
#define FOREVER FOREVER
PROCESS Loops
{
    TASK FOREVER;
}

/* Extra #endif Encountered: an #endif with no region open ... */
#endif
/* ... and the same code for a "#" that no hash word follows. */
#pragma

/* Unexpected Hash Word: a name defined without a body is defined again. */
#define DEBUG
#define DEBUG

/* Code 0xd3470234, which has no message text: a name that is already
   defined is given a body. */
#define DEBUG 1

/* Code 0xd3470236, no message text: after its first token, a body holds
   no character literal. */
#define STAR MARK '*'

/* Code 0xd3470235, no message text: a body would reach 2500 characters.
   Here its first token alone, a string of fifty lines, is too long. */
#define BANNER "01: The quick brown fox jumps over the lazy dog, 
02: The quick brown fox jumps over the lazy dog, 
03: The quick brown fox jumps over the lazy dog, 
04: The quick brown fox jumps over the lazy dog, 
05: The quick brown fox jumps over the lazy dog, 
06: The quick brown fox jumps over the lazy dog, 
07: The quick brown fox jumps over the lazy dog, 
08: The quick brown fox jumps over the lazy dog, 
09: The quick brown fox jumps over the lazy dog, 
10: The quick brown fox jumps over the lazy dog, 
11: The quick brown fox jumps over the lazy dog, 
12: The quick brown fox jumps over the lazy dog, 
13: The quick brown fox jumps over the lazy dog, 
14: The quick brown fox jumps over the lazy dog, 
15: The quick brown fox jumps over the lazy dog, 
16: The quick brown fox jumps over the lazy dog, 
17: The quick brown fox jumps over the lazy dog, 
18: The quick brown fox jumps over the lazy dog, 
19: The quick brown fox jumps over the lazy dog, 
20: The quick brown fox jumps over the lazy dog, 
21: The quick brown fox jumps over the lazy dog, 
22: The quick brown fox jumps over the lazy dog, 
23: The quick brown fox jumps over the lazy dog, 
24: The quick brown fox jumps over the lazy dog, 
25: The quick brown fox jumps over the lazy dog, 
26: The quick brown fox jumps over the lazy dog, 
27: The quick brown fox jumps over the lazy dog, 
28: The quick brown fox jumps over the lazy dog, 
29: The quick brown fox jumps over the lazy dog, 
30: The quick brown fox jumps over the lazy dog, 
31: The quick brown fox jumps over the lazy dog, 
32: The quick brown fox jumps over the lazy dog, 
33: The quick brown fox jumps over the lazy dog, 
34: The quick brown fox jumps over the lazy dog, 
35: The quick brown fox jumps over the lazy dog, 
36: The quick brown fox jumps over the lazy dog, 
37: The quick brown fox jumps over the lazy dog, 
38: The quick brown fox jumps over the lazy dog, 
39: The quick brown fox jumps over the lazy dog, 
40: The quick brown fox jumps over the lazy dog, 
41: The quick brown fox jumps over the lazy dog, 
42: The quick brown fox jumps over the lazy dog, 
43: The quick brown fox jumps over the lazy dog, 
44: The quick brown fox jumps over the lazy dog, 
45: The quick brown fox jumps over the lazy dog, 
46: The quick brown fox jumps over the lazy dog, 
47: The quick brown fox jumps over the lazy dog, 
48: The quick brown fox jumps over the lazy dog, 
49: The quick brown fox jumps over the lazy dog, 
50: The quick brown fox jumps over the lazy dog, "

/* Unrecognisd or Invalid Hash Word: #ifdef tests a name that is defined
   or unknown, not a reserved word. Its region is switched off all the
   same, up to its #endif. */
#ifdef PROTOCOL
STATE Hidden;
#endif

/* Too Many Nested Layers of Hash: twenty regions nest, the twenty-first
   fails (and is not opened). */
#ifndef N01 #ifndef N02 #ifndef N03 #ifndef N04 #ifndef N05
#ifndef N06 #ifndef N07 #ifndef N08 #ifndef N09 #ifndef N10
#ifndef N11 #ifndef N12 #ifndef N13 #ifndef N14 #ifndef N15
#ifndef N16 #ifndef N17 #ifndef N18 #ifndef N19 #ifndef N20
#ifndef N21
#endif #endif #endif #endif #endif #endif #endif #endif #endif #endif
#endif #endif #endif #endif #endif #endif #endif #endif #endif #endif

/* No Includes to Search for Included File: a relative name that is not
   there, while no include directory was given. */
#include "nowhere.tpl"

/* Cannot Open Source File: an absolute name that is not there. */
#include "\nowhere\missing.tpl"

/* Too Many Include Levels: a file that includes itself. The main file and
   eighteen copies of it are open when the next open fails. */
#include "self_include.tpl"

/* End of Line in String: a string that is never closed runs to the end
   of the input. */
OUTPUT "unfinished
