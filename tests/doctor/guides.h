#ifndef TAVOSSO_TESTS_DOCTOR_GUIDES_H
#define TAVOSSO_TESTS_DOCTOR_GUIDES_H

#include <string>
#include <utility>
#include <vector>

// The tables of the guides, read from the documents themselves and not by the doctor.
namespace Test {

/// A table's row under the head of its first column.
struct GuideRow {
    std::string head;
    std::vector<std::string> cells;

    /// The texts of the first cell: what is marked as code in it or, where nothing is, its lines.
    std::vector<std::string> Texts() const;
};

std::string ReadGuide(const std::string &name);
std::vector<GuideRow> RowsOf(const std::string &guide);

/// The texts that a login itself can end with, as the guide has them. Those that are the C++ library's own are left
/// out.
std::vector<std::string> TextsOfLogins();

}  // namespace Test

#endif
