#include "ToolOutput.h"

#include <fcntl.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <iostream>

namespace BrixTools {

void HoldClosedStandardDescriptors() {
    for (int fd = STDIN_FILENO; fd <= STDERR_FILENO; ++fd) {
        if (fcntl(fd, F_GETFD) == -1 && errno == EBADF) {
            const int held = open("/dev/null", O_RDONLY);
            if (held >= 0 && held != fd) close(held);
        }
    }
}

OutputBuffer::int_type OutputBuffer::overflow(int_type c) {
    if (sync() != 0) return traits_type::eof();
    if (!traits_type::eq_int_type(c, traits_type::eof())) {
        *pptr() = traits_type::to_char_type(c);
        pbump(1);
    }
    return traits_type::not_eof(c);
}

std::streamsize OutputBuffer::xsputn(const char* data, std::streamsize size) {
    if (size > epptr() - pptr()) {
        if (sync() != 0) return 0;
        if (size > epptr() - pptr()) return WriteAll(data, size) ? size : 0;
    }
    std::memcpy(pptr(), data, static_cast<size_t>(size));
    pbump(static_cast<int>(size));
    return size;
}

int OutputBuffer::sync() {
    const bool written = WriteAll(pbase(), pptr() - pbase());
    setp(buffer_, buffer_ + sizeof buffer_);
    return written ? 0 : -1;
}

bool OutputBuffer::WriteAll(const char* data, std::streamsize size) {
    while (size > 0 && error_ == 0) {
        const ssize_t done = write(STDOUT_FILENO, data, static_cast<size_t>(size));
        if (done < 0 && errno != EINTR) error_ = errno;
        if (done > 0) {
            data += done;
            size -= done;
        }
    }
    return error_ == 0;
}

OutputBuffer& CaptureStandardOutput() {
    // Nothing in the tools writes through C stdio: the streams can keep their own buffers, which
    // long listings write much faster through.
    std::ios::sync_with_stdio(false);
    // Never freed: anything that writes to std::cout up to the very end still has it.
    auto* buffer = new OutputBuffer;
    std::cout.rdbuf(buffer);
    return *buffer;
}

int FinishOutput(const char* tool, const OutputBuffer& buffer, int status) {
    std::cout.flush();
    if (buffer.Error() != 0 || !std::cout.good()) {
        std::cerr << tool << ": cannot write the output: "
                  << (buffer.Error() != 0 ? std::strerror(buffer.Error()) : "write error") << '\n';
        if (status == 0) status = 1;
    }
    std::cerr.flush();
    if (!std::cerr.good() && status == 0) status = 1;
    return status;
}

}  // namespace BrixTools
