// Narrow and 16-bit strings.
#include "zyr/std/values/CZYRString.h"

#include <cctype>
#include <cstring>
#include <memory>

#include "zyr/std/core/ZYRMem.h"
#include "zyr/std/values/CZYRUniString.h"

namespace ZYRStd {

namespace {

// '0'-'9', 'A'-'F', 'a'-'f'; anything else keeps the nibble the previous pair had.
unsigned char nibble(char c, unsigned char previous) {
    if (std::isdigit(static_cast<unsigned char>(c)))
        return static_cast<unsigned char>(c - '0');
    if (c >= 'A' && c <= 'F')
        return static_cast<unsigned char>(c - 'A' + 10);
    if (c >= 'a' && c <= 'f')
        return static_cast<unsigned char>(c - 'a' + 10);
    return previous;
}

constexpr size_t kStackBuffer = 128;

} // namespace

CZYRString::CZYRString(const CZYRString& s, unsigned int pos, unsigned int count)
    : CZYRClientBase(), text_(s.text_, pos, count) {}

CZYRString::CZYRString(const CZYRUniString& s) : CZYRString(UniStringToString(s)) {}

CZYRString::~CZYRString() = default;

uint32_t CZYRString::hashCode() const {
    uint32_t hash = 0;
    for (const char c : text_) {
        if (c == '\0')
            break;
        hash = hash * 31 + static_cast<unsigned char>(c);
    }
    return hash;
}

CZYRString operator+(const CZYRString& a, const CZYRString& b) {
    CZYRString joined(a);
    joined += b;
    return joined;
}

std::ostream& operator<<(std::ostream& out, const CZYRString& s) {
    return out << s.str();
}
std::istream& operator>>(std::istream& in, CZYRString& s) {
    return in >> s.str();
}
std::istream& getline(std::istream& in, CZYRString& s) {
    return std::getline(in, s.str());
}
std::istream& getline(std::istream& in, CZYRString& s, char delim) {
    return std::getline(in, s.str(), delim);
}

CZYRString CZYRStringFromHexASCIIString(const char* hex) {
    if (!hex || !*hex)
        return CZYRString();
    const size_t n = std::strlen(hex) / 2;
    // Small results are decoded on the stack, larger ones in a block from the front.
    unsigned char stackBuffer[kStackBuffer];
    std::unique_ptr<unsigned char, void (*)(unsigned char*)> heapBuffer(
        nullptr, [](unsigned char* p) { ZYRFree(p); });
    unsigned char* bytes = stackBuffer;
    if (n + 1 > kStackBuffer) {
        heapBuffer.reset(
            static_cast<unsigned char*>(ZYRSureMalloc(static_cast<unsigned int>(n + 1))));
        bytes = heapBuffer.get();
    }
    unsigned char high = 0, low = 0;
    for (size_t i = 0; i < n; ++i) {
        high = nibble(hex[2 * i], high);
        low = nibble(hex[2 * i + 1], low);
        bytes[i] = static_cast<unsigned char>(high * 16 + low);
    }
    return CZYRString(reinterpret_cast<const char*>(bytes), static_cast<unsigned int>(n));
}

CZYRWString::CZYRWString(const CZYRUniString& s) : CZYRWString(UniStringToWString(s)) {}

CZYRWString::~CZYRWString() = default;

} // namespace ZYRStd
