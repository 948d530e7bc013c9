/* pass.tpl: the source that the packaging tests lex, declare and check. */
#define LIMIT 3
PROTOCOL Demo;
STATE Idle;
NEXTSTATE Idle;
NEXTSTATE Busy;
TIMER T1 DURATION LIMIT;
OUTPUT Demo;
