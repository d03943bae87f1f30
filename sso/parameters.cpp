#include "sso/parameters.h"

#include "sso/sso.h"

namespace TAVO::SSO {

std::string WriteForm(const Parameters &parameters) { return WriteQuery(parameters).substr(1); }

std::string WriteQuery(const Parameters &parameters) {
    std::string query;
    for (const auto &[name, value] : parameters) {
        query += '&';
        query += name;
        query += '=';
        query += URLEncode(value);
    }
    query.front() = '?';
    return query;
}

}  // namespace TAVO::SSO
