#ifndef TAVOSSO_WEB_TEXT_H
#define TAVOSSO_WEB_TEXT_H

#include <json/json.h>

#include <cstddef>
#include <string>

#include "web/web.h"

// Texts that come from elsewhere, made fit to be shown, logged or followed.
namespace TAVO::Web {

/// Whether a text is UTF-8 without controls (C0, DEL and C1), line and paragraph separators, and the format characters
/// that are invisible or change the direction of the text.
bool IsPrintable(const std::string &text);

constexpr std::size_t kLongestLine = 200;

/// One printable line for logs and pages: each character that is not printable becomes a blank, a byte that is not
/// UTF-8 becomes U+FFFD, and the text is cut between two characters.
std::string OneLine(const std::string &text, std::size_t longest = kLongestLine);

/// The page to return to after a login: `origin` if it is a path of this site, else the start page.
std::string SafeOrigin(const std::string &origin, const std::string &startPage = "/index.cgi");

/// The JSON object that a text holds, null where it holds none.
Json::Value ParseObject(const std::string &text);

/// An object's member, empty unless it is a string.
std::string StringMember(const Json::Value &object, const char *name);

/// On one line.
std::string WriteCompact(const Json::Value &value);

}  // namespace TAVO::Web

#endif
