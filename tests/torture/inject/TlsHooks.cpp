// The TLS library below libcurl, which is OpenSSL: what libcurl calls there and looks at.
#include "Hook.h"

TORTURE_HOOK(TLS, 0, 0, int, OPENSSL_init_ssl, (unsigned long options, const void* settings),
             (options, settings));
TORTURE_HOOK(TLS, 0, nullptr, void*, SSL_CTX_new, (const void* method), (method));
TORTURE_HOOK(TLS, 0, nullptr, void*, SSL_new, (void* context), (context));
TORTURE_HOOK(TLS, 0, -1, int, SSL_connect, (void* session), (session));
TORTURE_HOOK(TLS, 0, -1, int, SSL_read, (void* session, void* bytes, int size),
             (session, bytes, size));
TORTURE_HOOK(TLS, 0, -1, int, SSL_write, (void* session, const void* bytes, int size),
             (session, bytes, size));
TORTURE_HOOK(TLS, 0, -1, int, SSL_shutdown, (void* session), (session));
TORTURE_HOOK(TLS, 0, 0, int, SSL_CTX_set_cipher_list, (void* context, const char* list),
             (context, list));
TORTURE_HOOK(TLS, 0, 1, int, SSL_CTX_set_alpn_protos,
             (void* context, const unsigned char* names, unsigned size), (context, names, size));
TORTURE_HOOK(TLS, 0, nullptr, void*, SSL_get1_peer_certificate, (const void* session), (session));
TORTURE_HOOK(TLS, 0, 0, int, SSL_set_ex_data, (void* session, int index, void* data),
             (session, index, data));
TORTURE_HOOK(TLS, 0, 1, long, SSL_get_verify_result, (const void* session), (session));
TORTURE_HOOK(TLS, 0, 0, int, X509_STORE_load_file, (void* store, const char* path), (store, path));
TORTURE_HOOK(TLS, 0, nullptr, void*, X509_STORE_add_lookup, (void* store, void* method),
             (store, method));
TORTURE_HOOK(TLS, 0, nullptr, void*, BIO_new, (const void* type), (type));
TORTURE_HOOK(TLS, 0, nullptr, void*, BIO_meth_new, (int type, const char* name), (type, name));
