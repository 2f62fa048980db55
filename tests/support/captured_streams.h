// Leads the C library's streams of this process into a file for a while.
#pragma once

#include <unistd.h>

#include <cstdio>
#include <string>

namespace kz7::test {

class CapturedStreams {
public:
    // Standard output, or standard error with it.
    explicit CapturedStreams(bool both) : output_(dup(1)), error_(dup(2)), file_(std::tmpfile()) {
        std::fflush(stdout);
        dup2(fileno(file_), 1);
        if (both) {
            dup2(fileno(file_), 2);
        }
    }
    ~CapturedStreams() { std::fclose(file_); }
    CapturedStreams(const CapturedStreams&) = delete;
    CapturedStreams& operator=(const CapturedStreams&) = delete;

    // Gives the streams back; what was written, with plain line feeds.
    std::string end() {
        std::fflush(stdout);
        dup2(output_, 1);
        dup2(error_, 2);
        close(output_);
        close(error_);
        std::rewind(file_);
        std::string text;
        for (int c = std::fgetc(file_); c != EOF; c = std::fgetc(file_)) {
            if (c != '\r') {
                text += static_cast<char>(c);
            }
        }
        return text;
    }

private:
    int output_;
    int error_;
    std::FILE* file_;
};

}  // namespace kz7::test
