// libcrypto functions that can fail: see calls.h.
#define OPENSSL_SUPPRESS_DEPRECATED
#include <openssl/bio.h>
#include <openssl/bn.h>
#include <openssl/evp.h>
#include <openssl/hmac.h>
#include <openssl/md5.h>
#include <openssl/rsa.h>

#include "tests/support/interposed/calls.h"

using Test::PassOn;

extern "C" {

BIO *BIO_new(const BIO_METHOD *type) { return PassOn<BIO *>("BIO_new", CALLER, nullptr, BIO_new, type); }

BIO *BIO_new_mem_buf(const void *data, int length) {
    return PassOn<BIO *>("BIO_new_mem_buf", CALLER, nullptr, BIO_new_mem_buf, data, length);
}

long BIO_ctrl(BIO *bio, int command, long number, void *pointer) {
    return PassOn("BIO_ctrl", CALLER, -1L, BIO_ctrl, bio, command, number, pointer);
}

int BIO_read(BIO *bio, void *data, int length) { return PassOn("BIO_read", CALLER, -1, BIO_read, bio, data, length); }

int BIO_write(BIO *bio, const void *data, int length) {
    return PassOn("BIO_write", CALLER, -1, BIO_write, bio, data, length);
}

BIGNUM *BN_bin2bn(const unsigned char *bytes, int length, BIGNUM *number) {
    return PassOn<BIGNUM *>("BN_bin2bn", CALLER, nullptr, BN_bin2bn, bytes, length, number);
}

RSA *RSA_new() { return PassOn<RSA *>("RSA_new", CALLER, nullptr, RSA_new); }

int RSA_set0_key(RSA *rsa, BIGNUM *n, BIGNUM *e, BIGNUM *d) {
    return PassOn("RSA_set0_key", CALLER, 0, RSA_set0_key, rsa, n, e, d);
}

EVP_PKEY *EVP_PKEY_new() { return PassOn<EVP_PKEY *>("EVP_PKEY_new", CALLER, nullptr, EVP_PKEY_new); }

int EVP_PKEY_assign(EVP_PKEY *key, int type, void *rsa) {
    return PassOn("EVP_PKEY_assign", CALLER, 0, EVP_PKEY_assign, key, type, rsa);
}

int EVP_PKEY_get_id(const EVP_PKEY *key) {
    return PassOn("EVP_PKEY_get_id", CALLER, EVP_PKEY_NONE, EVP_PKEY_get_id, key);
}

EVP_MD_CTX *EVP_MD_CTX_new() { return PassOn<EVP_MD_CTX *>("EVP_MD_CTX_new", CALLER, nullptr, EVP_MD_CTX_new); }

int EVP_DigestVerifyInit(EVP_MD_CTX *context, EVP_PKEY_CTX **keyContext, const EVP_MD *digest, ENGINE *engine,
                         EVP_PKEY *key) {
    return PassOn("EVP_DigestVerifyInit", CALLER, 0, EVP_DigestVerifyInit, context, keyContext, digest, engine, key);
}

int EVP_DigestUpdate(EVP_MD_CTX *context, const void *data, size_t length) {
    return PassOn("EVP_DigestUpdate", CALLER, 0, EVP_DigestUpdate, context, data, length);
}

int EVP_DigestVerifyFinal(EVP_MD_CTX *context, const unsigned char *signature, size_t length) {
    return PassOn("EVP_DigestVerifyFinal", CALLER, -1, EVP_DigestVerifyFinal, context, signature, length);
}

unsigned char *HMAC(const EVP_MD *digest, const void *key, int keyLength, const unsigned char *data, size_t length,
                    unsigned char *mac, unsigned int *macLength) {
    return PassOn<unsigned char *>("HMAC", CALLER, nullptr, HMAC, digest, key, keyLength, data, length, mac, macLength);
}

/// Fails without an entry in the error queue.
unsigned char *MD5(const unsigned char *data, size_t length, unsigned char *digest) {
    return Test::ShouldFail("MD5", CALLER) ? nullptr : Test::Next(MD5, "MD5")(data, length, digest);
}

}  // extern "C"
