#ifndef TAVOSSO_FRONTEND_ANSWER_H
#define TAVOSSO_FRONTEND_ANSWER_H

#include <string>

namespace Frontend {

/// What a CGI program answers, written to standard output: headers one at a time, then the one thing that ends it.
class Answer {
  public:
    /// A cookie for this host alone, over TLS alone, out of reach of scripts; without an age it ends with the browser.
    void SetCookie(const std::string &name, const std::string &value, const std::string &attributes = "");
    void ExpireCookie(const std::string &name);
    void AddHeader(const std::string &name, const std::string &value);

    /// The page that the user is on the way to: after a failure they can try again from there.
    std::string origin;

    void Redirect(const std::string &address);
    /// `content` is HTML; `title` is not.
    void Page(const std::string &status, const std::string &title, const std::string &content);

  private:
    std::string head;
};

}  // namespace Frontend

#endif
