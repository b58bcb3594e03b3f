// The standard output of autocli and hostsim: every byte of a result reaches it, or the program
// says why on stderr and fails. Both programs print only through these functions (hostsim's
// std::cout is routed through StdoutBuffer()).
#pragma once

#include <cstddef>
#include <streambuf>
#include <string>

namespace Output {

// Writes the whole of `data` to `fd`: interrupted writes are retried, and while a non-blocking
// descriptor is full it waits until it is writable again. Returns 0, or the errno of the write
// that failed.
int WriteAll(int fd, const char* data, size_t size);

// Appends to stdout (buffered). After a failed write the rest is dropped; Finish reports it.
void Out(const std::string& text);

// Writes to stderr as far as it can, after what Out() has buffered.
void Err(const std::string& text);

// Ends the output: flushes, closes stdout and returns `status` when everything was written.
// Otherwise returns 1, after one line "<program>: write error: <reason>" on stderr, or
// quietly when the reader has gone (a closed pipe, as under `| head -1`).
int Finish(const char* program, int status);

// A stream buffer that writes through Out(), for code that prints with std::cout.
std::streambuf* StdoutBuffer();

}  // namespace Output
