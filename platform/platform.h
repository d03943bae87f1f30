/**
 * @file
 * The four functions of the appliance's own libraries that single sign-on calls.
 *
 * Where a size is called usable, it counts the characters of the text and not its terminating NUL: the buffer holds one
 * byte more.
 */
#ifndef TAVOSSO_PLATFORM_PLATFORM_H
#define TAVOSSO_PLATFORM_PLATFORM_H

#include <stddef.h>  // NOLINT(modernize-deprecated-headers): a header for C as well

#pragma GCC visibility push(default)

#ifdef __cplusplus
extern "C" {
#endif

/**
 * Percent-encodes a text (RFC 3986, section 2.1): unreserved characters stand, every other byte becomes %XX.
 *
 * @param src   NUL-terminated text
 * @param dst   receives the encoded text and a NUL; untouched on failure
 * @param size  usable size of `dst`
 * @return 0 on success, non-zero when the text does not fit or an argument is null
 */
int TavoCgiURLEncode(const char *src, char *dst, size_t size);

/**
 * Encodes bytes as standard base64 (RFC 4648, section 4), on one line, with padding.
 *
 * @param src   `len` bytes; may be null when `len` is 0
 * @param dst   receives the text and a NUL; untouched on failure
 * @param size  size of `dst`, the NUL included
 * @return non-zero on success, 0 when the text does not fit or an argument is null
 *
 * The three flags are the appliance's; its callers pass 1, 0 and 1.
 */
int TLIBCBase64SzEncodeFull(const char *src, size_t len, char *dst, int flag1, size_t size, int flag2, int flag3);

/**
 * Decodes standard base64 (RFC 4648, section 4): one line, canonical, padded.
 *
 * @param src        `len` characters; may be null when `len` is 0
 * @param dst        receives the bytes; no NUL is added; untouched on failure
 * @param len_inout  in: the size of `dst`; out: the number of bytes written; untouched on failure
 * @return non-zero on success, 0 when the text is not base64, the bytes do not fit, or an argument is null
 */
int TLIBCBase64Decode(const char *src, size_t len, char *dst, size_t *len_inout);

/**
 * Turns DOMAIN\\user, the domain by its DNS name, into the same with the domain's NetBIOS name.
 *
 * The stand-in looks into /usr/tavo/etc/domains.conf first, and then asks the machine's winbindd. It waits for that for
 * a second at most: a child process asks, which the kernel then ends. The child is collected before the function
 * returns; a program that catches SIGCHLD is told of its end, and one that collects all of its children may be given
 * its process id.
 *
 * @param src   NUL-terminated name
 * @param dst   receives the converted name and a NUL; untouched on failure
 * @param size  usable size of `dst`
 * @return 0 on success; negative, with one line in the system's log, when the domain is unknown, nobody can be asked
 * for it, the name has no backslash or no user behind it, the result does not fit, memory runs out, or an argument is
 *         null
 */
int TAVOWinsUserNameFqdn2Netbios(const char *src, char *dst, size_t size);

#ifdef __cplusplus
}
#endif

#pragma GCC visibility pop

#endif
