#ifndef TAVOSSO_WEB_PROBE_H
#define TAVOSSO_WEB_PROBE_H

#include "web/web.h"

namespace TAVO::Web {

/**
 * Finds the cause of a failure for which the library has one text: requests the address that the library could not use,
 * without secrets. `network`, `certificate`, `invalid_response` and `unknown_key` then differ.
 *
 * Each request takes at most five seconds and accepts at most 1 MB. Returns `failed` unchanged if nothing is wrong with
 * the answers. Never throws.
 */
FailedLogin FindCause(FailedLogin failed) noexcept;

}  // namespace TAVO::Web

#endif
