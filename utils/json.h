#ifndef TAVOSSO_UTILS_JSON_H
#define TAVOSSO_UTILS_JSON_H

#include <json/json.h>

#include <initializer_list>
#include <optional>
#include <string>
#include <string_view>

// How the library reads and writes JSON. No exception of the JSON library leaves these functions: a text that it
// refuses has failed to parse, and a value that is not an object has no members.
namespace TAVO::Utils {

/// Parses a text. On failure the document is null, and when memory runs out it is as it was: never the half that had
/// been read.
bool ParseJson(std::string_view text, Json::Value &document);

/// Reads and parses a whole file. On failure the document is null or as it was.
bool LoadJsonFile(const char *path, Json::Value &document);

/// A copy of an object, or of null, with this member set. Throws Json::LogicError for any other document, and
/// std::bad_alloc.
Json::Value WithMember(const Json::Value &document, const char *name, const std::string &text);

/// The compact text of a document, with the line feed that the writer puts at its end.
std::string WriteCompactJson(const Json::Value &document);

/// The member of that name; null when there is none.
const Json::Value *FindMember(const Json::Value &document, const char *name);

/// Reads a member into a field if it is there and is a string (a boolean); otherwise leaves the field alone.
bool ReadMember(const Json::Value &document, const char *name, std::string &field);
bool ReadMember(const Json::Value &document, const char *name, bool &field);

struct StringMember {
    const char *name;
    std::string &field;
};

/// Reads each of the members as ReadMember does, in their order.
void ReadMembers(const Json::Value &document, std::initializer_list<StringMember> members);

/// A member read as text: null and missing give the empty text, strings, numbers and booleans their text; arrays and
/// objects have none.
std::optional<std::string> MemberText(const Json::Value &document, const char *name);

/// Whether the member, read as text, is exactly this text. A member without text never is.
bool MemberTextIs(const Json::Value &document, const char *name, const std::string &expected);

}  // namespace TAVO::Utils

#endif
