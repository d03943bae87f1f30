#ifndef TAVOSSO_FRONTEND_MESSAGES_H
#define TAVOSSO_FRONTEND_MESSAGES_H

#include <json/json.h>

#include <string>

namespace Frontend {

/// The texts of the pages in the language that the browser prefers.
class Messages {
  public:
    explicit Messages(const std::string &acceptLanguage);

    /// Returns a text of the catalogue as HTML.
    std::string operator[](const char *id) const;

  private:
    Json::Value catalogue_;
};

}  // namespace Frontend

#endif
