/**
 * @file
 * The four functions that the appliance provides. A usable size excludes the terminating NUL: the buffer is one byte
 * larger.
 *
 * A function reads only its input and writes only to its buffer. It throws no exception, works again after a failure,
 * and returns within ten seconds, also if the directory does not answer. It may change errno. Otherwise it leaves the
 * process as it was: no output, and no change of descriptors, threads, child processes, signals, timers, locale,
 * environment, ids, umask or working directory. Only syslog(3) may keep its descriptor.
 *
 * tavosso-platform-check verifies that a library keeps these promises.
 */
#ifndef TAVOSSO_PLATFORM_PLATFORM_H
#define TAVOSSO_PLATFORM_PLATFORM_H

#include <stddef.h>  // NOLINT(modernize-deprecated-headers): C programs include this header

#pragma GCC visibility push(default)

#ifdef __cplusplus
extern "C" {
#endif

/**
 * Percent-encodes a text as a value of a query string or of a form (RFC 3986, section 2.1). Each byte becomes %XX; a
 * blank may become "+". Letters, digits and -._~!$'()*,/:?@ may be copied. The stand-in copies only the unreserved
 * characters: letters, digits and -._~
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
 * @return non-zero on success, 0 if the text and its NUL do not fit or an argument is null
 */
int TLIBCBase64SzEncodeFull(const char *src, size_t len, char *dst, int flag1, size_t size, int flag2, int flag3);

/**
 * Decodes standard base64 (RFC 4648, section 4). Accepts only what the encoder writes: one line without blanks, padded,
 * and with zeros as padding bits. An empty text is valid.
 *
 * @param src        `len` characters; may be null if `len` is 0
 * @param dst        receives the bytes, and needs no room for a NUL; untouched on failure
 * @param len_inout  in: size of `dst`; out: number of bytes written; untouched on failure
 * @return non-zero on success, 0 if the text is not base64, the bytes do not fit, or an argument is null
 */
int TLIBCBase64Decode(const char *src, size_t len, char *dst, size_t *len_inout);

/**
 * Replaces the DNS name of the domain in DOMAIN\\user by its NetBIOS name, and copies the rest. The library passes the
 * DNS name in capitals.
 *
 * The function itself logs a failure by syslog(3), in one line without the control characters of `src`: the provider
 * chooses the name.
 *
 * A child process may do the work. It has ended and has been waited for when the function returns. The program may
 * receive SIGCHLD for it, and a program that waits for any child may receive its process id.
 *
 * The stand-in reads /usr/tavo/etc/domains.conf, then asks winbindd in a child process, for at most one second.
 *
 * @param src   NUL-terminated name
 * @param dst   receives the converted name and a NUL; untouched on failure
 * @param size  usable size of `dst`
 * @return 0 or more on success. Negative, with one log line, if the domain is unknown, the directory cannot be asked,
 *         the name has no backslash or no user, the result does not fit, memory runs out, or an argument is null
 */
int TAVOWinsUserNameFqdn2Netbios(const char *src, char *dst, size_t size);

#ifdef __cplusplus
}
#endif

#pragma GCC visibility pop

#endif
