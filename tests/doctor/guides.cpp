#include "tests/doctor/guides.h"

#include <fstream>
#include <iterator>
#include <sstream>
#include <stdexcept>

namespace Test {

namespace {

std::vector<std::string> Split(std::string text, const std::string &separator) {
    std::vector<std::string> pieces;
    for (std::size_t end = 0; (end = text.find(separator)) != std::string::npos;) {
        pieces.push_back(text.substr(0, end));
        text.erase(0, end + separator.size());
    }
    pieces.push_back(text);
    return pieces;
}

}  // namespace

std::vector<std::string> GuideRow::Texts() const {
    const std::vector<std::string> pieces = Split(cells.front(), "`");
    std::vector<std::string> texts;
    for (std::size_t i = 1; i < pieces.size(); i += 2) {
        texts.push_back(pieces[i]);
    }
    return texts.empty() ? Split(cells.front(), "<br>") : texts;
}

std::string ReadGuide(const std::string &name) {
    std::ifstream file(TAVOSSO_DOCUMENTS "/" + name);
    const std::string guide{std::istreambuf_iterator<char>(file), std::istreambuf_iterator<char>()};
    if (guide.empty()) {
        throw std::runtime_error("no guide " + name);
    }
    return guide;
}

std::vector<GuideRow> RowsOf(const std::string &guide) {
    std::vector<GuideRow> rows;
    std::istringstream lines(guide);
    std::string head;
    for (std::string line; std::getline(lines, line);) {
        if (line.compare(0, 2, "| ") != 0) {
            head.clear();
            continue;
        }
        const std::vector<std::string> cells = Split(line.substr(2, line.size() - 4), " | ");
        if (head.empty()) {
            head = cells.front();
        } else if (cells.front() != "---") {
            rows.push_back({head, cells});
        }
    }
    return rows;
}

std::vector<std::string> TextsOfLogins() {
    // What the guide itself says of the rows that no login comes to, and how many they are.
    const std::string guide = ReadGuide("integration.md");
    constexpr std::size_t kOthers = 8;
    if (guide.find("Of the last eight rows") == std::string::npos) {
        throw std::runtime_error("the guide no longer tells which texts a login can end with");
    }
    std::vector<GuideRow> rows;
    for (const GuideRow &row : RowsOf(guide)) {
        if (row.head == "text") {
            rows.push_back(row);
        }
    }
    std::vector<std::string> texts;
    for (std::size_t i = 0; i + kOthers < rows.size(); ++i) {
        for (const std::string &text : rows[i].Texts()) {
            texts.push_back(text);
        }
    }
    return texts;
}

}  // namespace Test
