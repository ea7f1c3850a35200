/// Another locale than the one the library was written under.
#pragma once

#include <algorithm>
#include <array>
#include <clocale>
#include <locale>
#include <string>

namespace support {

/// While it lives, the C++ library's global locale writes numbers with a decimal comma and grouped digits, and takes
/// every narrow character for a capital letter and a digit at once. The C library's is the one asked for, if the
/// machine has it; the C++ library's is always there.
class ForeignLocale {
public:
    explicit ForeignLocale(char const* cLocale)
        : cBefore_(std::setlocale(LC_ALL, nullptr))
        , cppBefore_(std::locale::global(foreign()))
    {
        std::setlocale(LC_ALL, cLocale);
    }
    ForeignLocale(ForeignLocale const&) = delete;
    ForeignLocale& operator=(ForeignLocale const&) = delete;
    ~ForeignLocale()
    {
        std::locale::global(cppBefore_);
        std::setlocale(LC_ALL, cBefore_.c_str());
    }

private:
    template <class Char>
    class CommaAndGroups : public std::numpunct<Char> {
        Char do_decimal_point() const override { return Char(','); }
        Char do_thousands_sep() const override { return Char('.'); }
        std::string do_grouping() const override { return "\1"; }
    };

    class AllAlike : public std::ctype<char> {
    public:
        AllAlike() : std::ctype<char>(table()) {}

    private:
        static mask const* table()
        {
            static std::array<mask, table_size> const masks = [] {
                std::array<mask, table_size> same{};
                std::fill(same.begin(), same.end(), mask(alpha | digit | upper));
                return same;
            }();
            return masks.data();
        }
        char do_tolower(char) const override { return 'x'; }
        char do_toupper(char) const override { return 'X'; }
    };

    static std::locale foreign()
    {
        std::locale const narrow(std::locale::classic(), new CommaAndGroups<char>);
        std::locale const both(narrow, new CommaAndGroups<wchar_t>);
        return std::locale(both, new AllAlike);
    }

    std::string cBefore_;
    std::locale cppBefore_;
};

} // namespace support
