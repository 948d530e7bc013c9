/*
 * signalling.tpl: call set-up signalling between a terminal and the
 * exchange. A protocol with its message templates, and the call control
 * process that drives it.
 *
 *   tplex check -I include signalling.tpl
 *   tplex check -I include -D TRACE signalling.tpl
 */

#include "common.tpl"

#ifdef TRACE
#define TRACE_MASK 0xFF
#endif
#ifndef TRACE
#define TRACE_MASK 0
#endif

PROTOCOL Signalling
{
    HEADER <"Q.931 subset, call control v1.2">;
    WINDOW 7;

    TEMPLATE Setup : MessageHeader
    {
        MESSAGE Setup VALUE 0x05;
        FIELD Bearer      : BYTE POSITION 5 MASK 0b01111111;
        FIELD CalledParty : CHARSTRING POSITION 6 LENGTH MAX_DIGITS;
        FIELD Urgent      : BIT POSITION 7 VALUE FALSE;
        MATCH MessageType = 0x05 AND CallRef /= 0;
    }

    TEMPLATE Release : MessageHeader
    {
        MESSAGE Release VALUE 0x4D;
        FIELD ReleaseCause : Cause POSITION 5 VALUE RELEASE_CAUSE;
        MATCH MessageType = 0x4D;
        GENERATE Release WITH ReleaseCause = RELEASE_CAUSE;
    }

    TEMPLATE Connect_Ack : MessageHeader
    {
        MESSAGE ConnectAck VALUE 0x0F;
        MATCH MessageType = 0x0F OR MessageType = 0x07;
    }

#ifdef TRACE
    /* Only in traced builds: a copy of every message to the log stream. */
    TEMPLATE TraceRecord
    {
        MESSAGE TraceCopy VALUE 0xF0;
        FIELD Stamp : TIMESTAMP POSITION 0 LENGTH 8;
        FIELD LogMask : UBYTE POSITION 8 VALUE TRACE_MASK;
        GENERATE TraceCopy TO LOG;
    }
#endif
}

PROCESS CallControl
{
    DCL calls INT = 0;
    DCL digit CHARSTRING = '0';
    DCL offset INT = -1;
    TIMER T303 DURATION 4000;

    START;
        NEXTSTATE Idle;

    STATE Idle;
        INPUT Setup FROM ENV;
            TASK calls = calls + 1;
            DECISION calls > MAX_CALLS;
                (TRUE):
                    OUTPUT Release TO SENDER;
                    NEXTSTATE Idle;
                ELSE:
                    OUTPUT Setup TO PARENT VIA CHANNELROUTE;
                    SET T303;
                    NEXTSTATE Proceeding;
            ENDDECISION;
    ENDSTATE;

    STATE Proceeding;
        INPUT ConnectAck;
            RESET T303;
            NEXTSTATE InCall;
        INPUT T303;
            /* no answer within the timer: give up the call */
            TASK calls = calls - 1;
            OUTPUT Release TO SENDER;
            NEXTSTATE Idle;
    ENDSTATE;

    STATE InCall;
        INPUT Release;
            TASK calls = calls - 1;
            NEXTSTATE Idle;
        INPUT ALL;
            // anything else in a call is kept for later
            NEXTSTATE InCall;
    ENDSTATE;
ENDPROCESS;
