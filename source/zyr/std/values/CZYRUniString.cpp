// Unicode strings on ICU: construction, conversion, comparison, interning and path forms.
#include "zyr/std/values/CZYRUniString.h"

#include <atomic>
#include <unicode/ucnv.h>
#include <unicode/unistr.h>
#include <unicode/utf16.h>

#include <algorithm>
#include <cctype>
#include <cstring>
#include <cwctype>
#include <memory>
#include <utility>

#include "zyr/std/core/CZYRError.h"
#include "zyr/std/core/CZYRSmartPtr.h"
#include "zyr/std/core/ZYRMem.h"
#include "zyr/std/core/ZYRUniqueID.h"
#include "zyr/std/core/internal/ZYRErrorBoundary.h"
#include "zyr/std/values/CZYRCommonUniStrings.h"
#include "zyr/std/values/CZYRString.h"

namespace ZYRStd {

namespace {

using ZYRPublic::I_Error;

constexpr const char* kSource = "source/zyr/std/CZYRUniString";

bool isAsciiName(const char* encoding) {
    return encoding &&
           (std::strcmp(encoding, "ASCII") == 0 || std::strcmp(encoding, "US-ASCII") == 0);
}

bool allAscii(const char* text, size_t length) {
    for (size_t i = 0; i < length; ++i)
        if (static_cast<unsigned char>(text[i]) >= 0x80)
            return false;
    return true;
}

// Well-formed UTF-16, or a path: a lone U+DC80..U+DCFF is a file-name byte outside UTF-8,
// kept as it is so that the name converts back to the same bytes.
bool keepsUnits(const char16_t* text, size_t length) {
    for (size_t i = 0; i < length; ++i) {
        if (U16_IS_LEAD(text[i])) {
            if (i + 1 == length || !U16_IS_TRAIL(text[i + 1]))
                return false;
            ++i;
        } else if (U16_IS_TRAIL(text[i]) && (text[i] < 0xDC80 || text[i] > 0xDCFF)) {
            return false;
        }
    }
    return true;
}

// ICU marks a string it could not build (an unknown converter name, its own allocation
// failing) as bogus, with no buffer at all; such a text is the empty text, so that every
// string has code units to compare.
icu::UnicodeString usable(icu::UnicodeString text) {
    if (text.isBogus())
        return {};
    return text;
}

// ASCII bytes map one to one onto code units; ICU's converter gives the same text, so the
// common case skips opening a converter.
icu::UnicodeString decode(const char* text, size_t length, const char* encoding) {
    if (isAsciiName(encoding) && allAscii(text, length)) {
        icu::UnicodeString out;
        char16_t* units = out.getBuffer(static_cast<int32_t>(length));
        if (!units) // ICU's own allocation failed
            throw CZYRError(ZYRPublic::kZYRErrorOutOfMemory,
                            "Out of memory in IImp_ZYRUniString constructor", kSource, __LINE__);
        for (size_t i = 0; i < length; ++i)
            units[i] = static_cast<unsigned char>(text[i]);
        out.releaseBuffer(static_cast<int32_t>(length));
        return out;
    }
    return usable(icu::UnicodeString(text, static_cast<int32_t>(length), encoding));
}

size_t unitLength(const char16_t* text) {
    return std::char_traits<char16_t>::length(text);
}

struct ConverterClose {
    void operator()(UConverter* converter) const noexcept { ucnv_close(converter); }
};

class IImp_ZYRUniString final : public CZYRPublicObject<I_UniString> {
public:
    // From bytes in `encoding`; `nullEncodingIsError` for the overload that names a length.
    IImp_ZYRUniString(const char* text, size_t length, const char* encoding,
                      bool nullEncodingIsError, I_Error& err) {
        ZYRErrorBoundaryVoid(err, "Error in IImp_ZYRUniString constructor", kSource, __LINE__, [&] {
            if (!text || (nullEncodingIsError && !encoding))
                throw CZYRError(ZYRPublic::kZYRErrorBadParam,
                                "Cannot create a NULL IImp_ZYRUniString", kSource, __LINE__);
            id_ = createUniqueID();
            text_ = decode(text, length, encoding);
        });
    }
    IImp_ZYRUniString(const char16_t* text, I_Error& err) {
        ZYRErrorBoundaryVoid(err, "Error in IImp_ZYRUniString constructor", kSource, __LINE__, [&] {
            id_ = createUniqueID();
            const size_t n = unitLength(text);
            if (keepsUnits(text, n)) {
                text_.setTo(text, static_cast<int32_t>(n));
                if (text_.isBogus()) {
                    text_ = icu::UnicodeString();
                    throw CZYRError(ZYRPublic::kZYRErrorOutOfMemory,
                                    "Out of memory in IImp_ZYRUniString constructor", kSource,
                                    __LINE__);
                }
            } else {
                text_ = usable(icu::UnicodeString(reinterpret_cast<const char*>(text),
                                                  static_cast<int32_t>(n * 2), "UTF-16LE"));
            }
        });
    }
    // A copy with a new identity, for concatenation.
    explicit IImp_ZYRUniString(const icu::UnicodeString& text)
        : id_(createUniqueID()), text_(text) {}

    uint64_t getUniqueID() const override { return id_; }

    void convert(char16_t* buffer, unsigned int* size, I_Error& err) const override {
        convert(reinterpret_cast<char*>(buffer), size, "UTF-16LE", err);
    }

    void convert(char* buffer, unsigned int* size, const char* encoding,
                 I_Error& err) const override {
        ZYRErrorBoundaryVoid(err, "Error in IImp_ZYRUniString::convert", kSource, __LINE__, [&] {
            if (!size || !encoding)
                throw CZYRError(ZYRPublic::kZYRErrorBadParam,
                                "Bad argument to IImp_ZYRUniString::convert", kSource, __LINE__);
            const unsigned int capacity = *size;
            UErrorCode status = U_ZERO_ERROR;
            std::unique_ptr<UConverter, ConverterClose> converter(ucnv_open(encoding, &status));
            if (U_FAILURE(status) || !converter)
                throw CZYRError(ZYRPublic::kZYRErrorBadParam,
                                "IImp_ZYRUniString::convert couldn't open converter for codePage",
                                kSource, __LINE__);
            const int32_t needed =
                ucnv_fromUChars(converter.get(), buffer, static_cast<int32_t>(capacity),
                                text_.getBuffer(), text_.length(), &status);
            *size = static_cast<unsigned int>(needed);
            if (U_FAILURE(status) && status != U_BUFFER_OVERFLOW_ERROR)
                throw CZYRError(ZYRPublic::kZYRErrorUnknown, "IImp_ZYRUniString::convert failed",
                                kSource, __LINE__);
            if (buffer)
                for (unsigned int at = *size; at < *size + 4 && at < capacity; ++at)
                    buffer[at] = '\0';
        });
    }

    bool lessThan(const I_UniString* other) const override {
        if (!other)
            return false;
        unsigned int otherBytes = 0;
        const char* otherData = other->getUTF16LEBuffer(&otherBytes);
        const unsigned int bytes = byteLength();
        const unsigned int common = std::min(bytes, otherBytes);
        const int order = common == 0 ? 0 : std::memcmp(data(), otherData, common);
        return order != 0 ? order < 0 : bytes < otherBytes;
    }

    bool equals(const I_UniString* other) const override {
        if (!other)
            return false;
        if (other == this)
            return true;
        unsigned int otherBytes = 0;
        const char* otherData = other->getUTF16LEBuffer(&otherBytes);
        return otherBytes == byteLength() &&
               (otherBytes == 0 || std::memcmp(data(), otherData, otherBytes) == 0);
    }

    // The text never changes once the string is shared, so its hash is worked out once.
    // Threads that race here compute the same value, so relaxed order is enough; the high
    // word marks the hash as known (a hash may well be 0).
    uint32_t hashCode() const override {
        uint64_t known = hash_.load(std::memory_order_relaxed);
        if (known == 0) {
            known = (uint64_t{1} << 32) | static_cast<uint32_t>(text_.hashCode());
            hash_.store(known, std::memory_order_relaxed);
        }
        return static_cast<uint32_t>(known);
    }

    const char* getUTF16LEBuffer(unsigned int* sizeInBytes) const override {
        if (!sizeInBytes)
            return nullptr;
        *sizeInBytes = byteLength();
        return data();
    }

    I_UniString* concat(const I_UniString* other, I_Error& err) const override {
        return ZYRErrorBoundary<I_UniString*>(
            err, nullptr, "Error in IImp_ZYRUniString::concat", kSource, __LINE__,
            [&]() -> I_UniString* {
                CZYRSmartZYRRefPtr<IImp_ZYRUniString> joined(new IImp_ZYRUniString(text_));
                if (other) {
                    unsigned int bytes = 0;
                    const char* units = other->getUTF16LEBuffer(&bytes);
                    joined->text_.append(reinterpret_cast<const char16_t*>(units), 0,
                                         static_cast<int32_t>(bytes / 2));
                }
                if (joined->text_.isBogus()) // ICU could not grow the text
                    throw CZYRError(ZYRPublic::kZYRErrorOutOfMemory,
                                    "Out of memory in IImp_ZYRUniString::concat", kSource,
                                    __LINE__);
                return joined.detach();
            });
    }

    bool isEmpty() const override { return text_.isEmpty(); }

private:
    const char* data() const { return reinterpret_cast<const char*>(text_.getBuffer()); }
    unsigned int byteLength() const { return static_cast<unsigned int>(text_.length()) * 2; }

    uint64_t id_ = 0;
    icu::UnicodeString text_;
    mutable std::atomic<uint64_t> hash_{0};
};

I_UniString* create(I_Error& err, const char* createMessage, auto&& build) {
    return ZYRErrorBoundary<I_UniString*>(err, nullptr, createMessage, kSource, __LINE__,
                                          [&]() -> I_UniString* { return build(); });
}

constexpr const char* kCreateFailed = "Error in IImp_ZYRUniString::create";

// Measures, grows the buffer when it is too small, converts, terminates.
template <class Unit>
unsigned int convertInto(const CZYRUniString& s, CZYRMemBuffer<Unit>& out, const char* encoding) {
    if (!s.isValid())
        return 0;
    unsigned int bytes = 0;
    s.convert(static_cast<char*>(nullptr), &bytes, encoding);
    const unsigned int length = bytes / sizeof(Unit);
    if (length == 0)
        return 0;
    if (out.count() < length + 1)
        out.grow(length + 1);
    unsigned int capacity = out.count() * static_cast<unsigned int>(sizeof(Unit));
    s.convert(reinterpret_cast<char*>(out.data()), &capacity, encoding);
    out[length] = Unit{0};
    return length;
}

unsigned short* copyUnits(const char16_t* units, size_t length, const char* outOfMemory,
                          I_Error& err) {
    auto* block =
        static_cast<unsigned short*>(ZYRMalloc(static_cast<unsigned int>((length + 1) * 2)));
    if (!block) {
        err.setError(ZYRPublic::kZYRErrorOutOfMemory, outOfMemory, kSource, __LINE__);
        return nullptr;
    }
    std::memcpy(block, units, length * 2);
    block[length] = 0;
    return block;
}

// Path helpers catch only the library's own errors as they are; anything else is recorded
// without a source.
template <class Body>
unsigned short* pathBoundary(I_Error& err, const char* unknownMessage, Body&& body) noexcept {
    if (err.errorOccurred())
        return nullptr;
    try {
        return body();
    } catch (const CZYRError& e) {
        err.setError(e.getError(), e.getMessage(), e.getSrcFileName(), e.getSrcLineNumber());
    } catch (...) {
        err.setError(ZYRPublic::kZYRErrorUnknown, unknownMessage, nullptr, -1);
    }
    return nullptr;
}

bool isHexUnit(char16_t unit) {
    return unit < 0x80 && std::isxdigit(unit);
}

unsigned int hexValue(char16_t unit) {
    return std::isdigit(unit) ? unit - u'0' : (std::tolower(unit) - 'a' + 10);
}

} // namespace

// ---- factories -----------------------------------------------------------------------------

I_UniString* createUniString(const char* text, const char* encoding, I_Error& err) {
    return create(err, kCreateFailed, [&] {
        return new IImp_ZYRUniString(text, text ? std::strlen(text) : 0, encoding, false, err);
    });
}

I_UniString* createUniString(const char* text, I_Error& err) {
    if (!text)
        return nullptr;
    return create(err, kCreateFailed, [&] {
        return new IImp_ZYRUniString(text, std::strlen(text), "ASCII", false, err);
    });
}

I_UniString* createUniString(const char* text, unsigned int length, const char* encoding,
                             I_Error& err) {
    if (!text)
        return nullptr;
    return create(err, kCreateFailed,
                  [&] { return new IImp_ZYRUniString(text, length, encoding, true, err); });
}

I_UniString* createUniString(const char16_t* text, I_Error& err) {
    if (!text)
        return nullptr;
    return create(err, kCreateFailed, [&] { return new IImp_ZYRUniString(text, err); });
}

// ---- CZYRUniString -------------------------------------------------------------------------

CZYRUniString::CZYRUniString(const char* text, const char* encoding) {
    C_Error err;
    intern(createUniString(text, encoding, err), err);
}

CZYRUniString::CZYRUniString(const char* text) {
    C_Error err;
    intern(createUniString(text, err), err);
}

CZYRUniString::CZYRUniString(const char* text, unsigned int length, const char* encoding) {
    C_Error err;
    intern(createUniString(text, length, encoding, err), err);
}

CZYRUniString::CZYRUniString(const char16_t* text) {
    C_Error err;
    intern(createUniString(text, err), err);
}

void CZYRUniString::intern(I_UniString* created, const ZYRPublic::I_Error& err) {
    if (created) {
        C_SmartPtr<I_UniString> held(created, false);
        const uint64_t id = created->getUniqueID();
        held = GetCommonUniStrings()->findCommonUniString(held);
        if (held->getUniqueID() == id)
            held = GetUniStringFromDynamicCache(held);
        adopt(held.detach());
    }
    if (err.errorOccurred()) {
        // The constructor does not finish, so nothing else would release the object.
        adopt(nullptr);
        throwCZYRErrorIfErrorOccurred(err);
    }
}

CZYRUniString::~CZYRUniString() = default;

bool CZYRUniString::operator==(const CZYRUniString& other) const {
    return impl_ && impl_->equals(other.impl_);
}

bool CZYRUniString::operator==(const I_UniString* other) const {
    return impl_ && impl_->equals(other);
}

bool CZYRUniString::operator<(const CZYRUniString& other) const {
    return !impl_ || impl_->lessThan(other.impl_);
}

bool CZYRUniString::operator<(const I_UniString* other) const {
    return !impl_ || impl_->lessThan(other);
}

void CZYRUniString::append(const CZYRUniString& other) {
    if (!other.impl_)
        return;
    if (!impl_) {
        if (this != &other)
            *this = other;
        return;
    }
    C_Error err;
    if (I_UniString* joined = impl_->concat(other.impl_, err))
        adopt(joined);
    throwCZYRErrorIfErrorOccurred(err);
}

CZYRUniString CZYRUniString::concat(const CZYRUniString& other) const {
    if (!impl_)
        return CZYRUniString();
    C_Error err;
    I_UniString* joined = impl_->concat(other.impl_, err);
    throwCZYRErrorIfErrorOccurred(err);
    return CZYRUniString(joined, false);
}

void CZYRUniString::convert(char* buffer, unsigned int* size, const char* encoding) const {
    if (!impl_) {
        if (buffer && size)
            std::memset(buffer, 0, std::min(*size, 4u));
        if (size)
            *size = 0;
        return;
    }
    C_Error err;
    impl_->convert(buffer, size, encoding, err);
    throwCZYRErrorIfErrorOccurred(err);
}

void CZYRUniString::convert(char16_t* buffer, unsigned int* size) const {
    convert(reinterpret_cast<char*>(buffer), size, "UTF-16LE");
}

const char* CZYRUniString::getUTF16LEBuffer(unsigned int* sizeInBytes) const {
    return impl_ ? impl_->getUTF16LEBuffer(sizeInBytes) : nullptr;
}

unsigned long long CZYRUniString::getUniqueID() const {
    if (!impl_)
        throw CZYRError(ZYRPublic::kZYRErrorInvalidObject,
                        "CZYRUniString::getUniqueID invalid object", kSource, __LINE__);
    return impl_->getUniqueID();
}

// ---- conversions ---------------------------------------------------------------------------

unsigned int UniStringToChar(const CZYRUniString& s, CZYRMemBuffer<char>& out) {
    return convertInto(s, out, "US-ASCII");
}

unsigned int UniStringToUTF8(const CZYRUniString& s, CZYRMemBuffer<char>& out) {
    return convertInto(s, out, "UTF-8");
}

unsigned int UniStringToWChar_t(const CZYRUniString& s, CZYRMemBuffer<char16_t>& out) {
    return convertInto(s, out, "UTF-16LE");
}

namespace {
CZYRString narrowString(const CZYRUniString& s, const char* encoding) {
    CZYRMemBuffer<char> buffer;
    return convertInto(s, buffer, encoding) ? CZYRString(buffer.data()) : CZYRString();
}
} // namespace

CZYRString UniStringToString(const CZYRUniString& s) {
    return narrowString(s, "US-ASCII");
}
CZYRString UniStringToUTF8String(const CZYRUniString& s) {
    return narrowString(s, "UTF-8");
}
CZYRString UniStringToHostEncodingString(const CZYRUniString& s) {
    return narrowString(s, GetDefaultCodePage());
}

CZYRWString UniStringToWString(const CZYRUniString& s) {
    CZYRMemBuffer<char16_t> buffer;
    return convertInto(s, buffer, "UTF-16LE") ? CZYRWString(buffer.data()) : CZYRWString();
}

const char* GetDefaultCodePage() {
    const char* name = ucnv_getDefaultName();
    return name ? name : "UTF-8";
}

unsigned short* UniStringToUTF16Path(CZYRUniString s, I_Error& err) {
    return pathBoundary(err, "Unknown exception in Uni2UTF16Path", [&]() -> unsigned short* {
        const CZYRWString wide(s);
        if (wide.empty())
            return nullptr;
        return copyUnits(wide.c_str(), wide.length(), "Uni2UTF16Path out of memory", err);
    });
}

unsigned short* ASCII2UTF16Path(const char* path, I_Error& err) {
    return pathBoundary(err, "Unknown exception in ASCII2UTF16Path", [&]() -> unsigned short* {
        if (!path || !*path)
            return nullptr;
        const size_t length = std::strlen(path);
        auto* block =
            static_cast<unsigned short*>(ZYRMalloc(static_cast<unsigned int>((length + 1) * 2)));
        if (!block) {
            err.setError(ZYRPublic::kZYRErrorOutOfMemory, "ASCII2UTF16Path out of memory", kSource,
                         __LINE__);
            return nullptr;
        }
        for (size_t i = 0; i <= length; ++i) {
            const auto byte = static_cast<unsigned char>(path[i]);
            if (byte >= 128) {
                ZYRFree(block);
                throw CZYRError(ZYRPublic::kZYRErrorInvalidFileName,
                                "ASCII2UTF16Path cannot handle non ASCII character", kSource,
                                __LINE__);
            }
            block[i] = byte;
        }
        return block;
    });
}

unsigned short* UniURL2UTF16Path(const CZYRUniString& url, I_Error& err) {
    return pathBoundary(err, "Unknown exception in UniURL2UTF16Path", [&]() -> unsigned short* {
        if (!url.isValid())
            return nullptr;
        const CZYRWString path = DecodeFileURL(CZYRWString(url));
        return copyUnits(path.c_str(), path.length(), "UniURL2UTF16Path out of memory", err);
    });
}

CZYRWString DecodeFileURL(const CZYRWString& url) {
    static constexpr char16_t kScheme[] = u"file://";
    if (url.empty())
        return CZYRWString();
    if (url.length() < 7 || url.str().compare(0, 7, kScheme) != 0)
        return url;
    const auto& in = url.str();
    CZYRWString decoded;
    auto& out = decoded.str();
    for (size_t i = 5; i < in.size(); ++i) {
        const char16_t unit = in[i];
        if (unit == u'%' && i + 2 < in.size() && isHexUnit(in[i + 1]) && isHexUnit(in[i + 2])) {
            out += static_cast<char16_t>(hexValue(in[i + 1]) * 16 + hexValue(in[i + 2]));
            i += 2;
        } else {
            out += unit; // '/' stays '/': the result is a POSIX path
        }
    }
    if (out.size() < 4)
        return decoded;
    const bool driveLetter = out.size() > 5 && out[3] < 0x80 && std::isalpha(out[3]) &&
                             (out[4] == u':' || out[4] == u'|');
    if (driveLetter) {
        out.erase(0, 3);
        out[1] = u':';
    } else {
        out.erase(0, 2);
    }
    return decoded;
}

} // namespace ZYRStd
