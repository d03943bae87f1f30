#include "doctor/answer.h"

#include <boost/algorithm/string/case_conv.hpp>
#include <boost/algorithm/string/trim.hpp>

#include "doctor/client.h"
#include "doctor/report.h"
#include "web/text.h"

namespace Doctor {

namespace {

constexpr long kServerErrors = 500;  // and above

std::string TitleOf(const std::string &html) {
    const std::string tag = "<title>";
    const std::string lower = boost::to_lower_copy(html);
    const std::size_t begin = lower.find(tag);
    const std::size_t end = lower.find("</title>", begin);
    if (begin == std::string::npos || end == std::string::npos) {
        return "";
    }
    return boost::trim_copy(html.substr(begin + tag.size(), end - begin - tag.size()));
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
