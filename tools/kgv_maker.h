// The data-file maker: writes .kgv files from a readable text description, so that tests,
// demos and benchmarks never carry hand-edited binary files.
//
// Text format: one directive per line; "#" starts a comment; words are separated by
// blanks and may be written in double quotes ("a name", with \" and \\ inside). Numbers
// are decimal or 0x-hexadecimal. Directives before the first record set the file header;
// the others describe the map of the current record, entry by entry, in order.
//
//   order native|swapped       byte order of the file (swapped = the other machine's order)
//   version N                  formatVersion (5)          oldest N     oldestReader (4)
//   magic N / magic2 N / kind N   header words (0xACC01ADE / 0xB01DFACE / 1)
//   saveTime N                 saveTime (0)
//   clockTime N / cpuTime N    collection times in tenths of a second (0)
//   java 0|1 / hitFlags 0|1    isJava and hitFlagsOnly (0)
//   recordCount N              the header's record count (default: the records given)
//   text STRING                the 88 header bytes start with STRING, byte for byte
//
//   record PATH [signature=N] [build=N] [first=N] [last=N] [sessions=N] [nofile=1]
//                              a record and its TagFile entry (sessions = its count, 1;
//                              nofile=1 leaves the entry out); signature defaults to 1
//   function NAME [line=N] [calls=N]
//                              a TagFunction entry, and a TagFuncLine entry when line= is given
//   block LINE [hits=N]        a TagBlock entry
//   blockline LINE [count=N]   a TagBlockLine entry (count 0)
//   empty                      an empty map entry
//   entry TAG VALUE [COUNT]    any map entry: TAG 0..15, VALUE up to 0x0FFFFFFF
//   name STRING                one more name in the record's string area
//   strings STRING             the string area is exactly STRING (NUL-padded to 4 bytes)
//   pad N                      N extra words at the end of the record (the index covers them)
//   stringWords N / mapCount N / size N
//                              override the record's header words or its index entry
//
//   generate records=N [first=K] [functions=F] [blocks=B] [seed=S] [build=T] [hits=0|1]
//                              N synthetic records numbered K.. named
//                              "gen/dirD/fileK.c" (D = K / 100), each with F functions of
//                              B blocks (every fourth a block line). The same number gives
//                              the same record (same signature and map) in every file, so
//                              files made with overlapping ranges share records; the seed
//                              varies the counts and times. hits=1 makes counts 0/1.
//
// Example:
//   clockTime 25
//   record src/main.c build=100 first=1700000000 last=1700000100
//   function main line=3 calls=1
//   block 4 hits=1
//   blockline 5
//   block 7 hits=0
#pragma once

#include <string>

#include "coverage/kgv_data.h"

// Builds the bytes of a data file; false with "line N: what" in error on a bad description.
bool makeKgvImage(const std::string& description, std::string& bytes, std::string& error);
// As makeKgvImage, then writes the bytes to path.
bool makeKgvFile(const std::string& description, const std::string& path, std::string& error);

// The file image of data in this machine's or the other byte order. Record sizes are
// those of the data where given, else computed.
std::string encodeKgvData(const KgvData& data, bool swapped);
