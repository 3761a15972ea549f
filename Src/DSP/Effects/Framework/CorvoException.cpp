#include "DSP/Effects/Framework/CorvoException.h"

namespace Corvo {

CorvoException::CorvoException(const std::string& message) : m_message(message) { m_stream << message; }
CorvoException::CorvoException(const CorvoException& other) : CorvoException(other.m_message) {}
CorvoException& CorvoException::operator=(const CorvoException& other) {
    m_stream.str({});
    m_stream << other.m_message;
    m_message = other.m_message;
    return *this;
}
CorvoException::~CorvoException() = default;

const char* CorvoException::what() const noexcept { return m_message.c_str(); }

}  // namespace Corvo
