#pragma once

#include <exception>
#include <sstream>
#include <string>

#include "Platform/Export.h"

namespace Corvo {

// What the library throws when reading or writing serialised data fails. Thrown by value. Text may be
// appended before it is thrown: throw CorvoException("Error reading data") << ": profile " << number;
class DSP_API CorvoException : public std::exception {
public:
    // Copies the message.
    explicit CorvoException(const std::string& message);
    CorvoException(const CorvoException& other);
    CorvoException& operator=(const CorvoException& other);
    ~CorvoException() override;

    // Appends a text or number to the message. Throws std::bad_alloc.
    template <typename T>
    CorvoException& operator<<(const T& text) {
        m_stream << text;
        m_message = m_stream.str();
        return *this;
    }

    // The message; valid until text is appended or the exception is destroyed.
    const char* what() const noexcept override;

private:
    std::ostringstream m_stream;
    std::string m_message;  // keeps what() free of allocation
};

}  // namespace Corvo
