#ifndef TAVOSSO_WEB_TEXT_H
#define TAVOSSO_WEB_TEXT_H

#include <json/json.h>

#include <cstddef>
#include <string>

#include "web/web.h"

// Makes untrusted texts safe to show, log or follow.
namespace TAVO::Web {

/// Returns whether a text is UTF-8 without control characters (C0, DEL, C1), line and paragraph separators, and format
/// characters that are invisible or change the direction of the text.
bool IsPrintable(const std::string &text);

constexpr std::size_t kLongestLine = 200;

/// Returns one printable line. Replaces unprintable characters by blanks and invalid bytes by U+FFFD, and cuts the text
/// between two characters.
std::string OneLine(const std::string &text, std::size_t longest = kLongestLine);

/// Returns `origin` if it is a path of this site, else the start page.
std::string SafeOrigin(const std::string &origin, const std::string &startPage = "/index.cgi");

/// Returns the JSON object in a text, or null.
Json::Value ParseObject(const std::string &text);

/// Returns a member; empty unless it is a string.
std::string StringMember(const Json::Value &object, const char *name);

/// Returns the JSON text on one line.
std::string WriteCompact(const Json::Value &value);

}  // namespace TAVO::Web

#endif
