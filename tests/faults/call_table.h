#ifndef TAVOSSO_TESTS_FAULTS_CALL_TABLE_H
#define TAVOSSO_TESTS_FAULTS_CALL_TABLE_H

namespace Test {

/// A C function of another library that the library calls.
struct CalledFunction {
    const char *name;
    const char *whyItCannotFail;  // null: it can fail; the tests make every call fail
};

constexpr char kNoResult[] = "has no result";
constexpr char kOnlyMemory[] = "uses existing memory";
constexpr char kConstant[] = "returns a constant";
constexpr char kRuntime[] = "compiler run time; memory_test.cpp covers exhausted memory";

constexpr CalledFunction kCalledFunctions[] = {
    // libc
    {"__assert_fail", "does not return"},
    {"__errno_location", kConstant},
    {"__libc_single_threaded", kConstant},
    {"__stack_chk_fail", kRuntime},
    {"calloc", nullptr},
    {"explicit_bzero", kNoResult},
    {"fclose", nullptr},
    {"ferror", nullptr},
    {"fopen", nullptr},
    {"fread", nullptr},
    {"free", kNoResult},
    {"getegid", "always succeeds"},
    {"geteuid", "always succeeds"},
    // If this fails, Boost 1.74 leaks the engine of the nonce: the constructor in boost/uuid/random_generator.hpp:104
    // throws from seed() after `new self_contained_impl()`.
    {"getrandom", nullptr},
    {"malloc", nullptr},
    {"memchr", kOnlyMemory},
    {"memcmp", kOnlyMemory},
    {"memcpy", kOnlyMemory},
    {"memmove", kOnlyMemory},
    {"memset", kOnlyMemory},
    {"setresgid", nullptr},
    {"setresuid", nullptr},
    {"snprintf", "formats one byte"},
    {"strcmp", kOnlyMemory},
    {"strerror_r", "has a text for every number"},
    {"strlen", kOnlyMemory},
    {"strnlen", kOnlyMemory},
    {"strstr", kOnlyMemory},
    {"syslog", kNoResult},
    {"time", nullptr},

    // libc, built with _FORTIFY_SOURCE
    {"__explicit_bzero_chk", kNoResult},
    {"__fread_chk", "counted as fread"},
    {"__memcpy_chk", kOnlyMemory},
    {"__memmove_chk", kOnlyMemory},
    {"__memset_chk", kOnlyMemory},
    {"__snprintf_chk", "formats one byte"},
    {"__syslog_chk", kNoResult},

    // libcurl
    {"curl_easy_cleanup", kNoResult},
    {"curl_easy_init", nullptr},
    {"curl_easy_perform", nullptr},
    {"curl_easy_setopt", nullptr},
    {"curl_easy_strerror", "has a text for every number"},
    {"curl_global_cleanup", kNoResult},
    {"curl_global_init", nullptr},

    // libcrypto
    {"BIO_ctrl", nullptr},
    {"BIO_f_base64", kConstant},
    {"BIO_free_all", kNoResult},
    {"BIO_new", nullptr},
    {"BIO_new_mem_buf", nullptr},
    {"BIO_push", "links existing objects"},
    {"BIO_read", nullptr},
    {"BIO_s_mem", kConstant},
    {"BIO_set_flags", kNoResult},
    {"BIO_write", nullptr},
    {"BN_bin2bn", nullptr},
    {"BN_free", kNoResult},
    {"ERR_pop_to_mark", "fails only if there is no mark"},
    {"ERR_set_mark", "fails only if the queue is empty"},
    {"EVP_DigestUpdate", nullptr},
    {"EVP_DigestVerifyFinal", nullptr},
    {"EVP_DigestVerifyInit", nullptr},
    {"EVP_MD_CTX_free", kNoResult},
    {"EVP_MD_CTX_new", nullptr},
    {"EVP_PKEY_assign", nullptr},
    {"EVP_PKEY_free", kNoResult},
    {"EVP_PKEY_get_id", nullptr},
    {"EVP_PKEY_new", nullptr},
    {"EVP_sha256", kConstant},
    {"EVP_sha384", kConstant},
    {"EVP_sha512", kConstant},
    {"HMAC", nullptr},
    {"MD5", nullptr},
    {"RSA_free", kNoResult},
    {"RSA_new", nullptr},
    {"RSA_set0_key", nullptr},

    // the platform
    {"TAVOWinsUserNameFqdn2Netbios", nullptr},
    {"TLIBCBase64Decode", nullptr},
    {"TLIBCBase64SzEncodeFull", nullptr},
    {"TavoCgiURLEncode", nullptr},

    // the C++ run time
    {"_Unwind_Resume", kRuntime},
    {"__cxa_allocate_exception", kRuntime},
    {"__cxa_atexit", kRuntime},
    {"__cxa_begin_catch", kRuntime},
    {"__cxa_end_catch", kRuntime},
    {"__cxa_finalize", kRuntime},
    {"__cxa_free_exception", kRuntime},
    {"__cxa_pure_virtual", kRuntime},
    {"__cxa_rethrow", kRuntime},
    {"__cxa_throw", kRuntime},
    {"__gxx_personality_v0", kRuntime},
    {"_ITM_deregisterTMCloneTable", kRuntime},
    {"_ITM_registerTMCloneTable", kRuntime},
    {"__gmon_start__", kRuntime},
};

}  // namespace Test

#endif
