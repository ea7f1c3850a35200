/// The wide-character string in which every path, key and message travels.
#pragma once

#include "platform/mu_platform_export.h"

#include <cstddef>
#include <string>
#include <utility>

/// Code pages of narrow texts, as the drawing SDK numbers them.
enum OdCodePageId {
    CP_UTF_8 = 46, ///< the one code page in use
};

/// A text of 32-bit wide characters. A plain value: copies are independent, and any thread may use its own.
///
/// Texts are compared and ordered by code unit; neither case nor composed forms are folded. A text may hold any
/// character, NUL included; operations that take a bare `wchar_t const*` end at its first NUL.
///
/// The narrow form is UTF-8. A file name is any sequence of bytes, so one that is not UTF-8 must survive the way disk,
/// text, disk: a byte that belongs to no valid sequence is held as U+DC80 + (byte - 0x80), and that character becomes
/// the byte again. Both directions are the same under every locale.
class MU_PLATFORM_EXPORT OdString {
public:
    static OdString const& kEmpty; ///< the empty text, never destroyed

    OdString() noexcept = default;
    /// Copies `text` up to its NUL; null gives the empty text.
    OdString(wchar_t const* text);
    /// Copies exactly `length` characters, NULs included.
    OdString(wchar_t const* text, std::size_t length);
    /// Converts a narrow text up to its NUL; null gives the empty text. `codePage` is always `CP_UTF_8`.
    OdString(char const* text, OdCodePageId codePage);
    /// Converts exactly `length` bytes, NULs included.
    OdString(char const* text, std::size_t length, OdCodePageId codePage);

    /// The characters followed by a NUL; valid until the text is changed or destroyed.
    wchar_t const* c_str() const noexcept { return text_.c_str(); }
    /// The number of characters, not of bytes.
    std::size_t getLength() const noexcept { return text_.size(); }
    /// Whether there is no character.
    bool isEmpty() const noexcept { return text_.empty(); }
    /// The character at `index`, which must be below `getLength()`.
    wchar_t getAt(std::size_t index) const noexcept { return text_[index]; }

    /// The first `count` characters, or the whole text when it is shorter.
    OdString left(std::size_t count) const;
    /// What follows the first `first` characters; empty when there is nothing.
    OdString mid(std::size_t first) const;
    /// At most `count` characters from `first` on.
    OdString mid(std::size_t first, std::size_t count) const;
    /// The last `count` characters, or the whole text when it is shorter.
    OdString right(std::size_t count) const;

    /// Negative, zero or positive as this text sorts before, with or after `other`, by code unit.
    int compare(OdString const& other) const noexcept { return text_.compare(other.text_); }

    /// The narrow form: UTF-8, with held bytes turned back into themselves.
    /// A character that UTF-8 cannot carry (a lone surrogate that holds no byte) is written in the three-byte pattern.
    std::string ansi_str() const;

    /// Replaces the text by `format`, filled in as `wprintf` does; `%ls` takes a `wchar_t const*`. There is no limit on
    /// the length. If the C library refuses the format, the text becomes `format` itself.
    /// `format` is never a text that came from outside: hand such a text in as an argument.
    OdString& format(wchar_t const* format, ...);

    /// Appends; a `wchar_t const*` up to its NUL, null nothing.
    ///@{
    OdString& operator+=(OdString const& other);
    OdString& operator+=(wchar_t const* other);
    OdString& operator+=(wchar_t other);
    ///@}

    /// Both texts, one after the other.
    ///@{
    friend OdString operator+(OdString const& left, OdString const& right)
    {
        std::wstring text;
        text.reserve(left.text_.size() + right.text_.size());
        text += left.text_;
        text += right.text_;
        return OdString(std::move(text));
    }
    friend OdString operator+(OdString&& left, OdString const& right) { return std::move(left += right); }
    friend OdString operator+(OdString left, wchar_t const* right) { return left += right, left; }
    friend OdString operator+(OdString left, wchar_t right) { return left += right, left; }
    ///@}

    /// By code unit.
    ///@{
    friend bool operator==(OdString const& a, OdString const& b) noexcept { return a.text_ == b.text_; }
    friend bool operator!=(OdString const& a, OdString const& b) noexcept { return a.text_ != b.text_; }
    friend bool operator<(OdString const& a, OdString const& b) noexcept { return a.text_ < b.text_; }
    friend bool operator>(OdString const& a, OdString const& b) noexcept { return b < a; }
    friend bool operator<=(OdString const& a, OdString const& b) noexcept { return !(b < a); }
    friend bool operator>=(OdString const& a, OdString const& b) noexcept { return !(a < b); }
    ///@}

private:
    explicit OdString(std::wstring text) noexcept : text_(std::move(text)) {}

    std::wstring text_;
};
