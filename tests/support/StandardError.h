/**
 * Captures the text that the process writes to standard error.
 */
#ifndef SUPPORT_STANDARDERROR_H
#define SUPPORT_STANDARDERROR_H

#include <cstdio>
#include <iostream>
#include <memory>
#include <stdexcept>
#include <string>
#include <unistd.h>

namespace OrvTest {

/** While this object exists, standard error is a temporary file. */
class StandardError {
public:
    StandardError() : _file(std::tmpfile(), &std::fclose), _saved(dup(STDERR_FILENO)) {
        if (_file == nullptr || _saved < 0 || dup2(fileno(_file.get()), STDERR_FILENO) < 0) {
            throw std::runtime_error("standard error cannot be redirected to a temporary file");
        }
    }

    ~StandardError() {
        dup2(_saved, STDERR_FILENO);
        close(_saved);
    }
    StandardError(const StandardError&) = delete;
    StandardError& operator=(const StandardError&) = delete;

    /** The text that was written so far. */
    std::string text() const {
        std::cerr.flush();
        std::fflush(stderr);
        std::string text(static_cast<std::size_t>(lseek(fileno(_file.get()), 0, SEEK_END)), '\0');
        if (pread(fileno(_file.get()), text.data(), text.size(), 0) != static_cast<ssize_t>(text.size())) {
            throw std::runtime_error("the text written to standard error cannot be read back");
        }
        return text;
    }

private:
    std::unique_ptr<std::FILE, int (*)(std::FILE*)> _file;
    int _saved;
};

} // namespace OrvTest

#endif
