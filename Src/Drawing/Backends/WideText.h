#pragma once

#include <array>
#include <string>
#include <string_view>

#include "Drawing/Backends/ResourceKeys.h"
#include "Platform/WindowsHeader.h"

namespace Corvo {

// A text key's characters as Windows takes them: UTF-16, without memory of its own. A byte that is no UTF-8
// becomes U+FFFD.
struct WideText {
    std::array<wchar_t, TextKey::kMostBytes + 1> text{};
    int length = 0;

    WideText() = default;
    explicit WideText(const TextKey& key) {
        length =
            MultiByteToWideChar(CP_UTF8, 0, key.text.data(), -1, text.data(), static_cast<int>(text.size()));
        if (length > 0) --length;  // the end was counted
    }
};

inline std::wstring WideString(std::string_view text) {
    const int bytes = static_cast<int>(text.size());
    std::wstring wide(text.size(), L'\0');
    const int length = MultiByteToWideChar(CP_UTF8, 0, text.data(), bytes, wide.data(), bytes);
    wide.resize(static_cast<std::size_t>(length));
    return wide;
}

}  // namespace Corvo
