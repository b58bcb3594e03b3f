// The standard output of autocli and hostsim; see Output.h.
#include "Output.h"

#include <poll.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>

namespace Output {

namespace {

constexpr size_t kFlushAt = 64 * 1024;

std::string pending;  // what Out() has not written yet
int failure = 0;      // the errno of the first failed write to stdout

void Flush() {
    if (failure == 0 && !pending.empty()) {
        failure = WriteAll(STDOUT_FILENO, pending.data(), pending.size());
    }
    pending.clear();
}

class Buffer : public std::streambuf {
  protected:
    int_type overflow(int_type c) override {
        if (!traits_type::eq_int_type(c, traits_type::eof())) {
            Out(std::string(1, traits_type::to_char_type(c)));
        }
        return traits_type::not_eof(c);
    }
    std::streamsize xsputn(const char* text, std::streamsize size) override {
        Out(std::string(text, static_cast<size_t>(size)));
        return size;
    }
};

}  // namespace

int WriteAll(int fd, const char* data, size_t size) {
    while (size > 0) {
        ssize_t written = write(fd, data, size);
        if (written > 0) {
            data += written;
            size -= static_cast<size_t>(written);
        } else if (written < 0 && (errno == EAGAIN || errno == EWOULDBLOCK)) {
            pollfd ready = {fd, POLLOUT, 0};
            if (poll(&ready, 1, -1) < 0 && errno != EINTR) return errno;
        } else if (written == 0 || errno != EINTR) {
            return written == 0 ? EIO : errno;
        }
    }
    return 0;
}

void Out(const std::string& text) {
    if (failure != 0) return;
    if (pending.empty() && text.size() >= kFlushAt) {
        // A large text goes out as it is, without a copy.
        failure = WriteAll(STDOUT_FILENO, text.data(), text.size());
        return;
    }
    pending += text;
    if (pending.size() >= kFlushAt) Flush();
}

void Err(const std::string& text) {
    Flush();
    WriteAll(STDERR_FILENO, text.data(), text.size());
}

int Finish(const char* program, int status) {
    Flush();
    // A file system may report a failed write only when the file is closed. EBADF: stdout was
    // closed from the start and nothing was written to it.
    if (close(STDOUT_FILENO) != 0 && failure == 0 && errno != EINTR && errno != EBADF) {
        failure = errno;
    }
    if (failure == 0) return status;
    if (failure != EPIPE)
        Err(std::string(program) + ": write error: " + std::strerror(failure) + "\n");
    return 1;
}

std::streambuf* StdoutBuffer() {
    // Never destroyed: std::cout still flushes it while the program's statics are torn down.
    static Buffer* buffer = new Buffer;
    return buffer;
}

}  // namespace Output
