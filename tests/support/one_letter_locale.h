#ifndef TAVOSSO_TESTS_SUPPORT_ONE_LETTER_LOCALE_H
#define TAVOSSO_TESTS_SUPPORT_ONE_LETTER_LOCALE_H

#include <cctype>
#include <locale>

namespace Test {

/// Makes all letters equal, ignoring case, in the locale of the process. Restores the locale.
class OneLetterLocale {
  public:
    OneLetterLocale() : before_(std::locale::global(std::locale(std::locale::classic(), new OneLetter))) {}
    ~OneLetterLocale() { std::locale::global(before_); }
    OneLetterLocale(const OneLetterLocale &) = delete;
    OneLetterLocale &operator=(const OneLetterLocale &) = delete;

  private:
    class OneLetter : public std::ctype<char> {
      protected:
        char do_toupper(char c) const override { return std::isalpha(static_cast<unsigned char>(c)) != 0 ? 'X' : c; }
        const char *do_toupper(char *begin, const char *end) const override {
            for (; begin != end; ++begin) {
                *begin = do_toupper(*begin);
            }
            return end;
        }
    };

    std::locale before_;
};

}  // namespace Test

#endif
