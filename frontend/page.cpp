#include "frontend/page.h"

namespace Frontend {

namespace {

constexpr char kBeforeTitle[] =
    "<meta charset=\"utf-8\">\n<meta name=\"viewport\" content=\"width=device-width, initial-scale=1\">\n<title>";

constexpr char kBeforeProduct[] =
    "</title>\n<link rel=\"icon\" href=\"/webman/ssoclient/mark.svg\" type=\"image/svg+xml\">\n"
    "<link rel=\"stylesheet\" href=\"/webman/ssoclient/style.css\">\n</head>\n<body>\n"
    "<header><img src=\"/webman/ssoclient/mark.svg\" alt=\"\" width=\"32\" height=\"32\"> ";

}  // namespace

void ShowPage(TAVO::Web::Response &response, const std::string &status, const Messages &messages, const char *title,
              const std::string &content) {
    response.status = status;
    response.AddHeader("Content-Type", "text/html; charset=utf-8");
    response.AddHeader("Content-Language", messages["language"]);
    response.AddHeader("Vary", "Accept-Language");
    response.body = "<!DOCTYPE html>\n<html lang=\"" + messages["language"] + "\" dir=\"" + messages["direction"] +
                    "\">\n<head>\n" + kBeforeTitle + messages[title] + kBeforeProduct + messages["product"] +
                    "</header>\n<main>\n<h1>" + messages[title] + "</h1>\n" + content + "</main>\n</body>\n</html>\n";
}

}  // namespace Frontend
