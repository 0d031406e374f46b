#pragma once
// Value types: which texts are values of a type, and how a message says that one is not. A node's
// value (tree.h) is a type and a text; value_format.h has the formats.
//
// No value holds a NUL byte, whatever its type: values cross the library's interface as C text.
// Bytes that are not UTF-8 are allowed where this table does not forbid them ("string", say); how
// such a value is sent in a message is for the sender to decide. Blanks around a value are part of
// it, and fit few types. Numbers are decimal, may have leading zeros and have no "+".
//
// Type                         Text
// uint8 uint16 uint32 uint64   a number in the range of the type
// int8 int16 int32 int64       the same, "-" before a negative one
// bool                         true or false
// float32 float64              a finite number such as 12, -0.5 or 1.5e-3, in the type's range
// char                         one printable ASCII character, blank included
// ipv4addr ipv6addr            192.0.2.1; 2001:db8::1, without a zone
// ipaddr                       either
// ipv4prefix ipv6prefix        address/length, length 0 to 32 or 0 to 128; bits behind may be set
// ipprefix                     either
// macaddr802                   six pairs of hex digits joined by ":"
// date                         YYYY/MM/DD, a day of the calendar
// time_sec time_ms time_us     HH:MM:SS, HH:MM:SS.mmm, HH:MM:SS.uuuuuu, up to 23:59:59
// datetime_sec _ms _us         a date, one blank and such a time
// duration_sec _ms _us         a uint64
// none                         nothing
// any string charlist          any text
// btype                        the name of a type in this table
// attribute                    a uint32
// utf8_string                  well-formed UTF-8
// binary                       pairs of hex digits, or nothing
// oid                          2 to 128 numbers, each a uint32, joined by "."; may start with a "."
// link name                    a node name (name.h)
// hostname                     labels of letters, digits and inner "-", 1 to 63 long, with dots
//                              between them, 253 at most in all
// uri                          scheme ":" and what may stand in a URI: no blanks, no raw non-ASCII,
//                              "%" only before two hex digits, at most one "#"
// regex                        a POSIX extended regular expression, of at most 1,024 bytes, whose
//                              repetitions unroll to at most 2,048 characters
// globpattern                  "*", "?", "[...]" and text; every bracket closed, "\" before any of
//                              these to have it literally

#include "framework/bnode.h"

#include <optional>
#include <string>
#include <string_view>

namespace ovhost
{

/// Nothing when the text is a value of the type, else what it should have been: "must be a decimal
/// number from 0 to 255".
[[nodiscard]] std::optional<std::string> value_fault(bn_type type, std::string_view text);

/// One message about a value that does not fit, from the node's name, the type, the value and what
/// value_fault() answered: `/a/b: "300" is not a uint8: must be a decimal number from 0 to 255`.
/// The value is quoted such that it cannot spoil the message: bytes that are ASCII control
/// characters or not UTF-8 show as "\xNN", and a value over 128 bytes is cut, with "..." behind the
/// quotes.
[[nodiscard]] std::string describe_fault(std::string_view name, bn_type type, std::string_view text,
                                         std::string_view reason);

} // namespace ovhost
