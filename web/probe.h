#ifndef TAVOSSO_WEB_PROBE_H
#define TAVOSSO_WEB_PROBE_H

#include "web/web.h"

namespace TAVO::Web {

/**
 * Distinguishes `network`, `certificate`, `invalid_response` and `unknown_key`, for which the library throws the same
 * texts. Requests the address that the library could not use, without secrets.
 *
 * Each request takes at most five seconds and accepts at most 1 MB. Returns `failed` unchanged if the responses are
 * valid. Never throws.
 */
FailedLogin FindCause(FailedLogin failed) noexcept;

}  // namespace TAVO::Web

#endif
