#ifndef TAVOSSO_DOCTOR_FILE_TEXT_H
#define TAVOSSO_DOCTOR_FILE_TEXT_H

#include <cstddef>
#include <string>

// What an editor can do to a JSON file. No text quotes the file, which may hold the client secret.
namespace Doctor {

struct TextProblem {
    std::string what;  // with line and column; empty if there is no problem
    std::string remedy;
};

/// Returns "line L, column C" of a byte, counted in characters from 1.
std::string PositionOf(const std::string &text, std::size_t offset);

/// Returns why a text is not JSON, such as "is empty", if an editor's habit is the cause.
TextProblem FindMistake(const std::string &text);

/// Returns the first byte that is not UTF-8. The library accepts it.
TextProblem FindInvalidByte(const std::string &text);

/// Returns the first key that occurs twice. The library reads the last one.
TextProblem FindDuplicateKey(const std::string &text);

/// Returns the name of the first character in a value that is usually pasted by mistake; empty if there is none.
std::string FindPastedCharacter(const std::string &value);

}  // namespace Doctor

#endif
