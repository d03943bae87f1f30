#ifndef TAVOSSO_FRONTEND_CATALOGUES_H
#define TAVOSSO_FRONTEND_CATALOGUES_H

#include <string>

namespace Frontend {

/// Returns the JSON text of a language's catalogue, `messages/LANGUAGE.json`; null if there is none.
const char *FindCatalogue(const std::string &language);

}  // namespace Frontend

#endif
