// Text operations shared by the host, the module and its siblings: printf-style
// formatting that never depends on the process locale, number parsing, UTF-8 aware
// case-insensitive comparison, and sorting and joining of string lists.
#pragma once

#include <cstdarg>
#include <cstddef>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

// Formats like vsprintf into a string of any length; numbers always use the C
// conventions ("%.2f" writes a point whatever the user's locale).
std::string FormatString(const char* format, ...) __attribute__((format(printf, 1, 2)));
std::string FormatStringV(const char* format, va_list args);

// One value for a placeholder of a stored pattern (a catalogue text, a code pattern).
struct PatternArg {
    enum class Kind { Text, Real, Int };
    PatternArg(const char* t) : kind(Kind::Text), text(t ? t : "") {}
    PatternArg(std::string t) : kind(Kind::Text), text(std::move(t)) {}
    PatternArg(std::string_view t) : kind(Kind::Text), text(t) {}
    PatternArg(double r) : kind(Kind::Real), real(r) {}
    PatternArg(int i) : kind(Kind::Int), integer(i) {}
    Kind kind;
    std::string text;
    double real = 0;
    long long integer = 0;
};

// Fills the printf placeholders of a pattern that is data, not code: each conversion
// (%s, %d, %i, %f, %g, %e, %x with flags, width and precision, "*" taking a bounded width
// or precision from the arguments) takes the next argument, converted to the
// placeholder's type; "%%" is a percent sign. A placeholder with no argument left takes
// the empty text or zero, and anything that is not a plain conversion (%n, %p, %ls...) is
// copied as it stands, so no pattern can read memory it was not given.
std::string FormatPattern(std::string_view pattern, const std::vector<PatternArg>& args);

// "%d".
std::string FormatInt(int value);

// decimals >= 0: "%.<decimals>f"; decimals < 0: "%g".
std::string FormatReal(double value, int decimals);

// Shortest text that reads back to the same double: "%g" wherever that is exact and
// has no exponent, else the shortest round-trip digits (fixed for ordinary magnitudes).
std::string FormatRealShortest(double value);

// Locale-independent parsing of a whole text (surrounding blanks allowed); nullopt when
// the text is not a number.
// The text without the blanks (spaces and tabs) at either end.
std::string TrimBlanks(std::string_view text);

std::optional<double> ParseReal(std::string_view text);
std::optional<long long> ParseInt(std::string_view text);

// Ascending, stable bubble order: equal strings keep their order.
void SortStrings(std::vector<std::string>& strings, bool ignoreCase);

// First string, then separator and string for each following one.
std::string JoinStrings(const std::vector<std::string>& strings, std::string_view separator);

// Compares two UTF-8 texts without regard to case, folding ASCII and the Latin letters
// of Windows-1252 (é/É, œ/Œ, š/Š, ÿ/Ÿ...). Answers <0, 0 or >0. Bytes that are not valid
// UTF-8 compare as themselves, after every valid character.
int CompareNoCase(std::string_view a, std::string_view b);
bool EqualsNoCase(std::string_view a, std::string_view b);

// Case-folded copy, so that two texts are EqualsNoCase exactly when their folds are equal.
std::string FoldCase(std::string_view text);

// Number of code points (an invalid byte counts as one).
std::size_t CharCount(std::string_view text);

// The first n code points of the text (all of it when shorter).
std::string FirstChars(std::string_view text, std::size_t n);

// The code points of a UTF-8 text, each invalid byte becoming U+FFFD, so that text from
// anywhere can go to an interface that only takes valid characters.
std::u32string DecodeUtf8(std::string_view text);

// UTF-8 of code points; surrogates and values beyond U+10FFFF become U+FFFD.
std::string EncodeUtf8(std::u32string_view text);
