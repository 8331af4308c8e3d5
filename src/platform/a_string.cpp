#include <cstring>

#include <tessarine/profile.hpp>

#include "platform/heap.h"
#include "platform/text_copy.h"

namespace tessarine::platform {

char *JoinText(char const *first, char const *second, char const *third) {
    const size_t a = std::strlen(first);
    const size_t b = std::strlen(second);
    const size_t c = std::strlen(third);
    if (a + b + c == 0) return nullptr;
    auto *text = static_cast<char *>(GlobalAlloc(GMEM_FIXED, a + b + c + 1));
    if (text == nullptr) return nullptr;
    std::memcpy(text, first, a);
    std::memcpy(text + a, second, b);
    std::memcpy(text + a + b, third, c);
    text[a + b + c] = '\0';
    return text;
}

void FreeText(char *text) {
    if (text != nullptr) GlobalFree(text);
}

}  // namespace tessarine::platform

using tessarine::platform::FreeText;
using tessarine::platform::JoinText;

AString::AString(char const *text) : text_(text == nullptr ? nullptr : JoinText(text)) {}

AString::AString(AString const &other)
    : text_(other.text_ == nullptr ? nullptr : JoinText(other.text_)) {}

AString::~AString() {
    FreeText(text_);
}

AString::operator char const *() const {
    return text_ == nullptr ? "" : text_;
}
