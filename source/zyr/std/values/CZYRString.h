/// \file
/// Narrow and 16-bit strings over the library's allocator, so their memory is counted.
#pragma once

#include <cstdint>
#include <istream>
#include <ostream>
#include <string>

#include "ZYRStdExport.h"
#include "zyr/std/core/CZYRClientBase.h"
#include "zyr/std/memory/CZYRStdAllocator.h"

namespace ZYRStd {

class CZYRUniString;

/// A narrow byte string whose memory comes from the library's allocator, with a 32-bit interface to
/// std::basic_string. A plain value type, one thread at a time.
class ZYRSTD_API CZYRString : public CZYRClientBase {
public:
    /// The standard string types underneath.
    ///@{
    using string_type = std::basic_string<char, std::char_traits<char>, CZYRStdAllocator<char>>;
    using iterator = string_type::iterator;
    using const_iterator = string_type::const_iterator;
    using reverse_iterator = string_type::reverse_iterator;
    using const_reverse_iterator = string_type::const_reverse_iterator;
    ///@}
    /// "Not found" from the find functions, and "to the end" as a position.
    static constexpr unsigned int npos = 4294967295u;

    CZYRString() = default;
    /// As the std::basic_string constructors: copies, `count` characters from `pos`, `length` bytes
    /// of `text`, or a range.
    ///@{
    CZYRString(const CZYRString& other) = default;
    CZYRString(CZYRString&& other) noexcept = default;
    CZYRString(const CZYRString& s, unsigned int pos, unsigned int count);
    CZYRString(const char* text) : text_(text) {}
    CZYRString(const char* text, unsigned int length) : text_(text, length) {}
    CZYRString(iterator first, iterator last) : text_(first, last) {}
    CZYRString(const_iterator first, const_iterator last) : text_(first, last) {}
    ///@}
    /// US-ASCII conversion up to the first zero byte; empty for an invalid string.
    explicit CZYRString(const CZYRUniString& s);
    /// Copies or takes over the other's text.
    ///@{
    CZYRString& operator=(const CZYRString& other) = default;
    CZYRString& operator=(CZYRString&& other) noexcept = default;
    ///@}
    ~CZYRString() override;

    /// As the std::basic_string members of the same names, with 32-bit lengths and positions; find
    /// functions return npos when nothing is found.
    ///@{
    const char* c_str() const { return text_.c_str(); }
    unsigned int length() const { return static_cast<unsigned int>(text_.length()); }
    bool empty() const { return text_.empty(); }
    void clear() { text_.clear(); }
    char& operator[](unsigned int i) { return text_[i]; }
    const char& operator[](unsigned int i) const { return text_[i]; }
    iterator begin() { return text_.begin(); }
    iterator end() { return text_.end(); }
    const_iterator begin() const { return text_.begin(); }
    const_iterator end() const { return text_.end(); }
    reverse_iterator rbegin() { return text_.rbegin(); }
    reverse_iterator rend() { return text_.rend(); }
    const_reverse_iterator rbegin() const { return text_.rbegin(); }
    const_reverse_iterator rend() const { return text_.rend(); }

    CZYRString& operator+=(const CZYRString& other) {
        text_ += other.text_;
        return *this;
    }
    CZYRString& operator+=(const char* text) {
        text_ += text;
        return *this;
    }
    bool operator==(const CZYRString& other) const { return text_ == other.text_; }

    unsigned int find(const char* s, unsigned int pos = 0) const {
        return npos32(text_.find(s, pos));
    }
    unsigned int find_first_of(const char* s, unsigned int pos = 0) const {
        return npos32(text_.find_first_of(s, pos));
    }
    unsigned int find_last_of(const char* s, unsigned int pos = npos) const {
        return npos32(text_.find_last_of(s, pos == npos ? string_type::npos : pos));
    }
    ///@}
    /// hash * 31 + byte over the bytes before the first zero, in 32 bits.
    uint32_t hashCode() const;

    /// The standard string inside, borrowed.
    ///@{
    const string_type& str() const { return text_; }
    string_type& str() { return text_; }
    ///@}

private:
    static unsigned int npos32(size_t at) {
        return at == string_type::npos ? npos : static_cast<unsigned int>(at);
    }
    friend CZYRString operator+(const CZYRString&, const CZYRString&);

    string_type text_;
};

/// Concatenation, byte-wise comparison and stream input and output, as for std::string.
///@{
ZYRSTD_API CZYRString operator+(const CZYRString& a, const CZYRString& b);
inline bool operator<(const CZYRString& a, const CZYRString& b) {
    return a.str() < b.str();
}
inline bool operator<=(const CZYRString& a, const CZYRString& b) {
    return a.str() <= b.str();
}
inline bool operator>(const CZYRString& a, const CZYRString& b) {
    return a.str() > b.str();
}
inline bool operator>=(const CZYRString& a, const CZYRString& b) {
    return a.str() >= b.str();
}
ZYRSTD_API std::ostream& operator<<(std::ostream& out, const CZYRString& s);
ZYRSTD_API std::istream& operator>>(std::istream& in, CZYRString& s);
ZYRSTD_API std::istream& getline(std::istream& in, CZYRString& s);
ZYRSTD_API std::istream& getline(std::istream& in, CZYRString& s, char delim);
///@}

/// Hexadecimal text to bytes; an odd last digit is ignored, a non-digit repeats the nibble
/// the previous pair had at that place.
ZYRSTD_API CZYRString CZYRStringFromHexASCIIString(const char* hex);

/// A 16-bit string whose memory comes from the library's allocator, with a 32-bit interface to
/// std::basic_string. A plain value type, one thread at a time.
class ZYRSTD_API CZYRWString : public CZYRClientBase {
public:
    /// The standard string types underneath.
    ///@{
    using string_type =
        std::basic_string<char16_t, std::char_traits<char16_t>, CZYRStdAllocator<char16_t>>;
    using iterator = string_type::iterator;
    using const_iterator = string_type::const_iterator;
    ///@}

    CZYRWString() = default;
    /// As the std::basic_string constructors.
    ///@{
    CZYRWString(const CZYRWString& other) = default;
    CZYRWString(CZYRWString&& other) noexcept = default;
    CZYRWString(const CZYRWString& s, unsigned int pos) : text_(s.text_, pos) {}
    CZYRWString(const CZYRWString& s, unsigned int pos, unsigned int count)
        : text_(s.text_, pos, count) {}
    CZYRWString(const char16_t* text) : text_(text) {}
    CZYRWString(const char16_t* text, unsigned int length) : text_(text, length) {}
    CZYRWString(iterator first, iterator last) : text_(first, last) {}
    CZYRWString(const_iterator first, const_iterator last) : text_(first, last) {}
    ///@}
    /// UTF-16 up to the first zero unit; empty for an invalid string.
    explicit CZYRWString(const CZYRUniString& s);
    /// Copies or takes over the other's text.
    ///@{
    CZYRWString& operator=(const CZYRWString& other) = default;
    CZYRWString& operator=(CZYRWString&& other) noexcept = default;
    ///@}
    ~CZYRWString() override;

    /// As the std::basic_string members of the same names, with 32-bit lengths.
    ///@{
    const char16_t* c_str() const { return text_.c_str(); }
    unsigned int length() const { return static_cast<unsigned int>(text_.length()); }
    bool empty() const { return text_.empty(); }
    void clear() { text_.clear(); }
    char16_t& operator[](unsigned int i) { return text_[i]; }
    const char16_t& operator[](unsigned int i) const { return text_[i]; }
    iterator begin() { return text_.begin(); }
    iterator end() { return text_.end(); }
    const_iterator begin() const { return text_.begin(); }
    const_iterator end() const { return text_.end(); }
    CZYRWString& operator+=(const CZYRWString& other) {
        text_ += other.text_;
        return *this;
    }
    CZYRWString& operator+=(char16_t unit) {
        text_ += unit;
        return *this;
    }
    bool operator==(const CZYRWString& other) const { return text_ == other.text_; }
    ///@}

    /// The standard string inside, borrowed.
    ///@{
    const string_type& str() const { return text_; }
    string_type& str() { return text_; }
    ///@}

private:
    string_type text_;
};

} // namespace ZYRStd
