// Standard output for the command-line tools: a write that fails is remembered and reported, so
// a listing or a backup cut short never looks complete.
#pragma once

#include <streambuf>

namespace BrixTools {

// A standard descriptor the caller left closed is held on /dev/null, opened for reading only:
// no file the run opens can take its number (and receive the output), and the output's writes
// still fail, to be reported. Call first thing in main.
void HoldClosedStandardDescriptors();

// Standard output's buffer: it remembers why a write failed, which the stream does not, and
// writes nothing more after that.
class OutputBuffer : public std::streambuf {
  public:
    OutputBuffer() { setp(buffer_, buffer_ + sizeof buffer_); }
    int Error() const { return error_; }

  protected:
    int_type overflow(int_type c) override;
    std::streamsize xsputn(const char* data, std::streamsize size) override;
    int sync() override;

  private:
    bool WriteAll(const char* data, std::streamsize size);

    char buffer_[1 << 16];
    int error_ = 0;
};

// Puts an OutputBuffer under std::cout for the rest of the process.
OutputBuffer& CaptureStandardOutput();

// Flushes standard output and error. When any output could not be written, says so on standard
// error as `tool`, and turns a successful `status` into 1.
int FinishOutput(const char* tool, const OutputBuffer& buffer, int status);

}  // namespace BrixTools
