// Bit and ASCII codecs: byte strings to printable narrow text and back.
//
// The client programs carry keys and digests as text with these three exports. They work on
// buffers the caller supplies, allocate nothing and keep no state; each writes a terminating
// zero byte itself.
//
//   unsigned char bytes[2] = {0x0F, 0xA0};
//   char hex[2 * 2 + 1];
//   BitsToAscii(bytes, 2, hex);            // "0fa0", returns 4
//   unsigned char back[(4 + 1) / 2 + 1];
//   AsciiToBits(hex, 4, back);             // 0x0F 0xA0 0x00, returns 2
//
// A null pointer throws LumoException::PreconditionFailed0 before anything is written.
#pragma once

#include "owutils/Export.h"

// Hexadecimal text to bytes, high digit first. Digits 0-9, A-F and a-f; any other character
// (taken modulo 128) counts as 0. An odd last digit becomes the high half of a last byte.
// `output` needs (length + 1) / 2 bytes plus one for the terminating zero.
// Returns length / 2 rounded down.
OWUTILS_API unsigned int AsciiToBits(const char* input, unsigned int length, unsigned char* output);

// Bytes to lower-case hexadecimal text, high half first. `output` needs 2 * length + 1 chars.
// Returns length * 2 (a length of 0 or less writes only the terminator).
OWUTILS_API int BitsToAscii(const unsigned char* input, int length, char* output);

// Bytes to groups of three decimal digits with leading zeros, no separator. `output` needs
// 3 * length + 1 chars. Returns length * 3 (a length of 0 or less writes only the terminator).
OWUTILS_API int BitsToDecimal(const unsigned char* input, int length, char* output);
