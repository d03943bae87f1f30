#ifndef TAVOSSO_UTILS_JSON_H
#define TAVOSSO_UTILS_JSON_H

#include <json/json.h>

#include <initializer_list>
#include <optional>
#include <string>
#include <string_view>

// Reads and writes JSON. No function throws an exception of jsoncpp, except as documented. Exhausted memory is
// std::bad_alloc. A value that is not an object has no members.
namespace TAVO::Utils {

/// Parses a text. Returns false, with a null document, if it is not JSON or is nested too deeply. If memory runs out,
/// throws std::bad_alloc and leaves the document unchanged.
bool ParseJson(std::string_view text, Json::Value &document);

/// Reads a file and parses it as ParseJson does. Returns false, with an unchanged document, if it cannot be read.
bool LoadJsonFile(const char *path, Json::Value &document);

/// Returns a copy of an object or of null with this member set. Throws Json::LogicError for any other document.
Json::Value WithMember(const Json::Value &document, const char *name, const std::string &text);

/// Returns the compact text of a document, with a line feed at its end.
std::string WriteCompactJson(const Json::Value &document);

/// Returns the member of that name, or null.
const Json::Value *FindMember(const Json::Value &document, const char *name);

/// Reads a member of the field's type. Returns false, with an unchanged field, if there is none.
bool ReadMember(const Json::Value &document, const char *name, std::string &field);
bool ReadMember(const Json::Value &document, const char *name, bool &field);

struct StringMember {
    const char *name;
    std::string &field;
};

/// Reads each member as ReadMember does.
void ReadMembers(const Json::Value &document, std::initializer_list<StringMember> members);

/// Returns a member as text: empty if it is null or missing; nothing if it is an array or an object.
std::optional<std::string> MemberText(const Json::Value &document, const char *name);

/// Returns whether the member as text equals this text; false for arrays and objects.
bool MemberTextIs(const Json::Value &document, const char *name, const std::string &expected);

}  // namespace TAVO::Utils

#endif
