// Leads the C library's streams of this process into a file, or out of one, for a while.
#pragma once

#include <unistd.h>

#include <cstdio>
#include <string>

namespace kz7::test {

class CapturedStreams {
public:
    CapturedStreams() : output_(dup(1)), error_(dup(2)), file_(std::tmpfile()) {
        std::fflush(stdout);
        dup2(fileno(file_), 1);
        dup2(fileno(file_), 2);
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

// Standard input is that text.
class FedInput {
public:
    explicit FedInput(const std::string& text) : input_(dup(0)), file_(std::tmpfile()) {
        std::fwrite(text.data(), 1, text.size(), file_);
        std::rewind(file_);
        dup2(fileno(file_), 0);
        std::clearerr(stdin);
    }
    ~FedInput() {
        dup2(input_, 0);
        std::clearerr(stdin);
        close(input_);
        std::fclose(file_);
    }
    FedInput(const FedInput&) = delete;
    FedInput& operator=(const FedInput&) = delete;

private:
    int input_;
    std::FILE* file_;
};

}  // namespace kz7::test
