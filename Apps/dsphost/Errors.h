#pragma once

#include <stdexcept>
#include <string>

namespace dsphost {

// The command was asked for something it cannot do: bad arguments or bad input. The message is one line
// that names the culprit and says what would be accepted. Exit status 2.
struct UserError : std::runtime_error {
    using std::runtime_error::runtime_error;
};

// The system failed on the way: disk full, closed pipe. Exit status 1.
struct IoError : std::runtime_error {
    using std::runtime_error::runtime_error;
};

}  // namespace dsphost
