#include "frontend/page.h"

#include "web/text.h"

namespace Frontend {

namespace {

constexpr char kBeforeTitle[] =
    "<!DOCTYPE html>\n<html lang=\"en\">\n<head>\n<meta charset=\"utf-8\">\n"
    "<meta name=\"viewport\" content=\"width=device-width, initial-scale=1\">\n<title>";

constexpr char kBeforeContent[] =
    "</title>\n<link rel=\"icon\" href=\"/webman/ssoclient/mark.svg\" type=\"image/svg+xml\">\n"
    "<link rel=\"stylesheet\" href=\"/webman/ssoclient/style.css\">\n</head>\n<body>\n"
    "<header><img src=\"/webman/ssoclient/mark.svg\" alt=\"\" width=\"32\" height=\"32\"> Network storage</header>\n"
    "<main>\n";

}  // namespace

void ShowPage(TAVO::Web::Response &response, const std::string &status, const std::string &title,
              const std::string &content) {
    response.status = status;
    response.AddHeader("Content-Type", "text/html; charset=utf-8");
    response.body =
        kBeforeTitle + TAVO::Web::EscapeHtml(title) + kBeforeContent + content + "</main>\n</body>\n</html>\n";
}

}  // namespace Frontend
