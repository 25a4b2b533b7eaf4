// Fixed-width cells of the summary: justification, counts, percentages, elapsed times, dates.
#pragma once

#include <cstdint>
#include <string>

// Texts and widths are limited to 1024 characters.
std::string justify_right(const char* text, unsigned width, char fill = ' ');
std::string justify_left(const char* text, unsigned width, char fill = ' ');
std::string justify_centre(const char* text, unsigned width, char fill = ' ');

std::string format_count(unsigned width, std::uint32_t value);
// The low 16 bits; "10K+" above 9999.
std::string format_small_count(unsigned width, std::uint32_t value);
// "-- " for a zero whole, "100%" only when part equals whole, else the truncated percentage.
std::string format_percent(unsigned width, std::uint32_t part, std::uint32_t whole);
// Tenths of a second as [d ][h:]mm:ss.t.
std::string format_elapsed(unsigned width, std::uint32_t tenths);
// "%m/%d %H:%M" within 180 days before now, else "%m/%d/%Y".
std::string format_date(unsigned width, std::uint32_t seconds);
// The current time the date format compares with (read once; tests may set it).
void set_format_date_now(std::uint32_t now);
