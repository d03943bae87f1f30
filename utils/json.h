#ifndef TAVOSSO_UTILS_JSON_H
#define TAVOSSO_UTILS_JSON_H

#include <json/json.h>

#include <initializer_list>
#include <optional>
#include <string>
#include <string_view>

// How the library reads and writes JSON. jsoncpp's exceptions do not leave these functions, except as documented: text
// that it rejects fails to parse, a value that is not an object has no members, and memory that runs out is
// std::bad_alloc.
namespace TAVO::Utils {

/// Parses a text. If it is not JSON, or is nested too deeply, returns false and the document is null. If memory runs
/// out, throws std::bad_alloc and the document is unchanged.
bool ParseJson(std::string_view text, Json::Value &document);

/// Reads and parses a whole file, as ParseJson does. If the file cannot be read, returns false and the document is
/// unchanged.
bool LoadJsonFile(const char *path, Json::Value &document);

/// A copy of an object, or of null, with this member set. Throws Json::LogicError for any other document.
Json::Value WithMember(const Json::Value &document, const char *name, const std::string &text);

/// The compact text of a document, with the writer's final line feed.
std::string WriteCompactJson(const Json::Value &document);

/// The member of that name; null if there is none.
const Json::Value *FindMember(const Json::Value &document, const char *name);

/// Reads a member into a field if it exists and is a string (a boolean). Otherwise returns false and leaves the field
/// unchanged.
bool ReadMember(const Json::Value &document, const char *name, std::string &field);
bool ReadMember(const Json::Value &document, const char *name, bool &field);

struct StringMember {
    const char *name;
    std::string &field;
};

/// Reads each of the members as ReadMember does, in their order.
void ReadMembers(const Json::Value &document, std::initializer_list<StringMember> members);

/// A member read as text: empty for null and for a missing member; nothing for an array or an object.
std::optional<std::string> MemberText(const Json::Value &document, const char *name);

/// Whether the member, read as text, equals this text. Arrays and objects never do.
bool MemberTextIs(const Json::Value &document, const char *name, const std::string &expected);

}  // namespace TAVO::Utils

#endif
