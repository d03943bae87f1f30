/**
 * @file
 * The four functions that the appliance provides. A usable size excludes the terminating NUL: the buffer is one byte
 * larger.
 */
#ifndef TAVOSSO_PLATFORM_PLATFORM_H
#define TAVOSSO_PLATFORM_PLATFORM_H

#include <stddef.h>  // NOLINT(modernize-deprecated-headers): C programs include this header

#pragma GCC visibility push(default)

#ifdef __cplusplus
extern "C" {
#endif

/**
 * Percent-encodes a text (RFC 3986, section 2.1). Unreserved characters are copied, other bytes become %XX.
 *
 * @param src   NUL-terminated text
 * @param dst   receives the encoded text and a NUL; untouched on failure
 * @param size  usable size of `dst`
 * @return 0 on success, non-zero if the text does not fit or an argument is null
 */
int TavoCgiURLEncode(const char *src, char *dst, size_t size);

/**
 * Encodes bytes as standard base64 (RFC 4648, section 4) on one line, with padding. Pass 1, 0 and 1 as the flags, which
 * the appliance defines.
 *
 * @param src   `len` bytes; may be null if `len` is 0
 * @param dst   receives the text and a NUL; untouched on failure
 * @param size  size of `dst`, including the NUL
 * @return non-zero on success, 0 if the text does not fit or an argument is null
 */
int TLIBCBase64SzEncodeFull(const char *src, size_t len, char *dst, int flag1, size_t size, int flag2, int flag3);

/**
 * Decodes standard base64 (RFC 4648, section 4): one line, canonical, padded.
 *
 * @param src        `len` characters; may be null if `len` is 0
 * @param dst        receives the bytes without a NUL; untouched on failure
 * @param len_inout  in: size of `dst`; out: number of bytes written; untouched on failure
 * @return non-zero on success, 0 if the text is not base64, the bytes do not fit, or an argument is null
 */
int TLIBCBase64Decode(const char *src, size_t len, char *dst, size_t *len_inout);

/**
 * Replaces the DNS name of the domain in DOMAIN\\user by its NetBIOS name.
 *
 * The stand-in reads /usr/tavo/etc/domains.conf, then asks winbindd, for at most one second. A child process asks; it
 * has ended when the function returns. The program may receive SIGCHLD for it, and a program that waits for any child
 * may receive its process id.
 *
 * @param src   NUL-terminated name
 * @param dst   receives the converted name and a NUL; untouched on failure
 * @param size  usable size of `dst`
 * @return 0 on success. Negative, with one log line, if the domain is unknown, winbindd cannot be asked, the name has
 *         no backslash or no user, the result does not fit, memory runs out, or an argument is null
 */
int TAVOWinsUserNameFqdn2Netbios(const char *src, char *dst, size_t size);

#ifdef __cplusplus
}
#endif

#pragma GCC visibility pop

#endif
