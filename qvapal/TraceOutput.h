// tracePrintf and the two replaceable hooks behind it: formatting and console output.
#pragma once

#include <cstdarg>
#include <cstddef>

namespace nQVAPAL000 {

// Bounded formatting with truncation; returns what vsnprintf returns.
using FormatHook = int (*)(char* buffer, size_t size, const char* format, va_list arguments);
// Shows one piece of text; the default drops it at interrupt level, else writes to the console.
using ConsoleOutputHook = void (*)(const char* text);

// Replaceable at start-up or in tests; written before other threads trace.
extern FormatHook formatHook;
extern ConsoleOutputHook consoleOutputHook;

int defaultFormat(char* buffer, size_t size, const char* format, va_list arguments);
void defaultConsoleOutput(const char* text);

// Formats into a 256-byte buffer (longer text is cut at 255 characters, no newline added)
// and hands it to consoleOutputHook. Any thread may call it.
void tracePrintf(const char* format, ...) __attribute__((format(printf, 1, 2)));

// Formats through formatHook into the caller's buffer.
int traceFormat(char* buffer, size_t size, const char* format, ...)
    __attribute__((format(printf, 3, 4)));

}  // namespace nQVAPAL000
