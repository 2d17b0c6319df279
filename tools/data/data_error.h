// The one error type of the data tool: a message for the user.
#pragma once

#include <fmt/format.h>

#include <stdexcept>
#include <utility>

namespace tessaly::data {

/// What was found and what was expected, in one line. Ends the command with a non-zero exit code.
class DataError : public std::runtime_error {
public:
    template <typename... Arguments>
    explicit DataError(fmt::format_string<Arguments...> text, Arguments&&... arguments)
        : std::runtime_error(fmt::format(text, std::forward<Arguments>(arguments)...)) {}
};

}  // namespace tessaly::data
