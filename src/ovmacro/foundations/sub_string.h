// BasicSubString: a non-owning view of characters, a begin and an end pointer.
//
// Scanners take a view by reference and move its begin forward as they consume text; tokens, variable names
// and error positions are views or pointers into the caller's buffer, which must outlive them.
//
//     BasicSubString rest(text);
//     while (rest && *rest.begin() == ' ') rest.Advance(1);
#pragma once

#include <cstring>
#include <string>
#include <string_view>

#include "ovmacro/foundations/types.h"

namespace orvan {

class BasicSubString {
public:
    constexpr BasicSubString() = default;
    constexpr BasicSubString(const char* begin, const char* end) : begin_(begin), end_(end) {}
    BasicSubString(const char* zeroTerminated)  // NOLINT: implicit, like std::string_view
        : begin_(zeroTerminated), end_(zeroTerminated ? zeroTerminated + std::strlen(zeroTerminated) : nullptr) {}
    BasicSubString(const basic_xstring& s)  // NOLINT: implicit view of a string
        : begin_(s.data()), end_(s.data() + s.size()) {}
    constexpr BasicSubString(std::string_view s)  // NOLINT: implicit view
        : begin_(s.data()), end_(s.data() + s.size()) {}

    constexpr const char* begin() const { return begin_; }
    constexpr const char* end() const { return end_; }
    constexpr int64 size() const { return end_ - begin_; }
    constexpr bool empty() const { return begin_ == end_; }
    constexpr explicit operator bool() const { return begin_ != end_; }
    constexpr char operator[](int64 i) const { return begin_[i]; }
    // The first character; the view must not be empty.
    constexpr char front() const { return *begin_; }
    constexpr char back() const { return end_[-1]; }

    void SetBegin(const char* p) { begin_ = p; }
    void SetEnd(const char* p) { end_ = p; }
    void Advance(int64 n) { begin_ += n; }

    basic_xstring GetString() const { return empty() ? basic_xstring() : basic_xstring(begin_, end_); }
    constexpr std::string_view view() const {
        return empty() ? std::string_view() : std::string_view(begin_, static_cast<size_t>(end_ - begin_));
    }
    constexpr operator std::string_view() const { return view(); }  // NOLINT: views convert freely

private:
    const char* begin_ = nullptr;
    const char* end_ = nullptr;
};

// Byte-wise order of two views: negative, zero or positive.
int strcmp(BasicSubString a, BasicSubString b);
int strcmp(BasicSubString a, const char* b);
inline bool operator==(BasicSubString a, BasicSubString b) { return a.view() == b.view(); }
inline bool operator!=(BasicSubString a, BasicSubString b) { return !(a == b); }
inline bool operator==(BasicSubString a, const char* b) { return a.view() == std::string_view(b); }
inline bool operator!=(BasicSubString a, const char* b) { return !(a == b); }
// True when the two texts are equal ignoring ASCII case.
bool CaseInsensitiveCompare(BasicSubString a, BasicSubString b);

// Orders views by strcmp, for maps keyed by names.
struct SubStringLess {
    bool operator()(BasicSubString a, BasicSubString b) const { return a.view() < b.view(); }
};

}  // namespace orvan
