#include "doctor/answer.h"

#include <boost/algorithm/string/find.hpp>
#include <boost/algorithm/string/trim.hpp>

#include "doctor/client.h"
#include "doctor/report.h"
#include "web/text.h"

namespace Doctor {

namespace {

constexpr long kServerErrors = 500;  // and above

std::string TitleOf(const std::string &html) {
    const auto begin = boost::ifind_first(html, "<title>");
    const auto end = boost::ifind_first(html, "</title>");
    return begin.empty() || end.empty() || end.begin() < begin.end()
               ? ""
               : boost::trim_copy(std::string(begin.end(), end.begin()));
}

}  // namespace

bool IsProvidersError(const Transfer &transfer) { return transfer.status >= kServerErrors; }

std::string DescribeAnswer(const Transfer &transfer, const std::string &content) {
    std::string text = "HTTP " + std::to_string(transfer.status);
    const Json::Value json = TAVO::Web::ParseObject(content);
    if (!transfer.location.empty()) {
        text += ", redirects to " + transfer.location;
    } else if (content.empty()) {
        text += ", empty";
    } else if (json.isMember("error")) {
        text += ", " + ErrorText(json);
    } else {
        text += ", " + (transfer.contentType.empty() ? "no content type" : transfer.contentType);
    }
    const std::string title = TitleOf(content);
    return text + (title.empty() ? "" : ", titled " + Quoted(title));
}

}  // namespace Doctor
