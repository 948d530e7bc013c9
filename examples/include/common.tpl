/*
 * common.tpl: definitions shared by the protocols of the exchange.
 * Included from signalling.tpl through the include directory "include".
 */

#define MAX_CALLS 32
#define MAX_DIGITS 20
#define RELEASE_CAUSE 0x10

/* The header every message of the family starts with. */
TEMPLATE MessageHeader
{
    FIELD Discriminator : UBYTE POSITION 0 VALUE 0x08;
    FIELD CallRefLength : NIBBLE POSITION 1 MASK 0b00001111;
    FIELD CallRef       : UINT POSITION 2 LENGTH 2;
    FIELD MessageType   : UBYTE POSITION 4;
}

TYPE Cause = UBYTE;
