// How the tool reports a job that cannot go on: one line naming the file and
// what is wrong. A Failure ends the run with exit code 1, a UsageFailure
// (bad arguments) with 2.
#pragma once

#include <cstdint>
#include <stdexcept>
#include <string>

namespace tessarine::cli {

class Failure : public std::runtime_error {
  public:
    Failure(const std::string &file, const std::string &what) : std::runtime_error(file + ": " + what) {}
};

class UsageFailure : public std::runtime_error {
  public:
    explicit UsageFailure(const std::string &what) : std::runtime_error(what) {}
};

// A stop asked for by the user (Ctrl-C): reported, exit code 1.
class Interrupted : public Failure {
  public:
    explicit Interrupted(const std::string &file) : Failure(file, "stopped; the file is left valid") {}
};

// Words for a library status, with the system's reason for a file failure.
std::string StatusText(int32_t status);

// Throws a Failure for a failed library call: "<file>: cannot <doing>: <status text>".
[[noreturn]] void FailStatus(const std::string &file, const std::string &doing, int32_t status);

// Throws when the library result is a failure.
inline void Check(int32_t status, const std::string &file, const std::string &doing) {
    if (static_cast<int16_t>(status) < 0) FailStatus(file, doing, status);
}

}  // namespace tessarine::cli
