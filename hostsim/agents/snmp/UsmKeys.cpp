#include "hostsim/agents/snmp/UsmKeys.h"

#include <dlfcn.h>
#include <openssl/evp.h>
#include <openssl/hmac.h>
#include <openssl/rand.h>

#include <memory>
#include <stdexcept>

namespace BrixSim::Snmp {

namespace {

// libcrypto is loaded on first use: only the SNMP agent needs it, and loading it with every
// library of the host (its few thousand symbols are bound at load) would slow down every command.
struct Libcrypto {
    explicit Libcrypto(void* library) : handle(library) {}

    template <class Function>
    Function Symbol(const char* name) const {
        void* address = dlsym(handle, name);
        if (!address) throw std::runtime_error(std::string("libcrypto has no ") + name);
        return reinterpret_cast<Function>(address);
    }

    void* handle;
#define BRIX_LIBCRYPTO_FUNCTION(name) \
    const decltype(&::name) name = Symbol<decltype(&::name)>(#name)
    BRIX_LIBCRYPTO_FUNCTION(EVP_md5);
    BRIX_LIBCRYPTO_FUNCTION(EVP_sha1);
    BRIX_LIBCRYPTO_FUNCTION(EVP_aes_128_cfb128);
    BRIX_LIBCRYPTO_FUNCTION(EVP_MD_CTX_new);
    BRIX_LIBCRYPTO_FUNCTION(EVP_MD_CTX_free);
    BRIX_LIBCRYPTO_FUNCTION(EVP_DigestInit_ex);
    BRIX_LIBCRYPTO_FUNCTION(EVP_DigestUpdate);
    BRIX_LIBCRYPTO_FUNCTION(EVP_DigestFinal_ex);
    BRIX_LIBCRYPTO_FUNCTION(HMAC);
    BRIX_LIBCRYPTO_FUNCTION(EVP_CIPHER_CTX_new);
    BRIX_LIBCRYPTO_FUNCTION(EVP_CIPHER_CTX_free);
    BRIX_LIBCRYPTO_FUNCTION(EVP_CipherInit_ex);
    BRIX_LIBCRYPTO_FUNCTION(EVP_CipherUpdate);
    BRIX_LIBCRYPTO_FUNCTION(EVP_CipherFinal_ex);
    BRIX_LIBCRYPTO_FUNCTION(RAND_bytes);
#undef BRIX_LIBCRYPTO_FUNCTION
};

const Libcrypto& Crypto() {
    static const Libcrypto library = [] {
        // Stays loaded for the life of the process.
        void* handle = dlopen(BRIX_LIBCRYPTO_SONAME, RTLD_NOW | RTLD_LOCAL);
        if (!handle) {
            throw std::runtime_error(std::string("cannot load libcrypto: ") + dlerror());
        }
        return Libcrypto(handle);
    }();
    return library;
}

const EVP_MD* Digest(AuthProtocol protocol) {
    switch (protocol) {
        case AuthProtocol::Md5:
            return Crypto().EVP_md5();
        case AuthProtocol::Sha1:
            return Crypto().EVP_sha1();
        case AuthProtocol::None:
            break;
    }
    throw std::invalid_argument("no digest for authentication protocol none");
}

struct DigestContext {
    const Libcrypto& crypto = Crypto();
    std::unique_ptr<EVP_MD_CTX, decltype(&EVP_MD_CTX_free)> context{crypto.EVP_MD_CTX_new(),
                                                                    crypto.EVP_MD_CTX_free};
    explicit DigestContext(AuthProtocol protocol) {
        if (!context || crypto.EVP_DigestInit_ex(context.get(), Digest(protocol), nullptr) != 1) {
            throw std::runtime_error("digest initialisation failed");
        }
    }
    void Update(std::string_view bytes) {
        if (crypto.EVP_DigestUpdate(context.get(), bytes.data(), bytes.size()) != 1) {
            throw std::runtime_error("digest update failed");
        }
    }
    std::string Final() {
        unsigned char out[EVP_MAX_MD_SIZE];
        unsigned int size = 0;
        if (crypto.EVP_DigestFinal_ex(context.get(), out, &size) != 1) {
            throw std::runtime_error("digest failed");
        }
        return std::string(reinterpret_cast<char*>(out), size);
    }
};

}  // namespace

std::optional<AuthProtocol> ParseAuthProtocol(std::string_view name) {
    if (name == "MD5") return AuthProtocol::Md5;
    if (name == "SHA1" || name == "SHA") return AuthProtocol::Sha1;
    return std::nullopt;
}

size_t DigestSize(AuthProtocol protocol) {
    return protocol == AuthProtocol::Md5 ? 16 : 20;
}

std::string PasswordToKey(AuthProtocol protocol, std::string_view password) {
    if (password.empty()) throw std::invalid_argument("empty password");
    constexpr size_t kTotal = 1048576;
    constexpr size_t kChunk = 64;
    DigestContext digest(protocol);
    char chunk[kChunk];
    size_t index = 0;
    for (size_t done = 0; done < kTotal; done += kChunk) {
        for (char& byte : chunk) byte = password[index++ % password.size()];
        digest.Update(std::string_view(chunk, kChunk));
    }
    return digest.Final();
}

std::string LocalizeKey(AuthProtocol protocol, std::string_view ku, std::string_view engineId) {
    DigestContext digest(protocol);
    digest.Update(ku);
    digest.Update(engineId);
    digest.Update(ku);
    return digest.Final();
}

std::string LocalizedKey(AuthProtocol protocol, std::string_view password,
                         std::string_view engineId) {
    return LocalizeKey(protocol, PasswordToKey(protocol, password), engineId);
}

std::string Hmac96(AuthProtocol protocol, std::string_view key, std::string_view message) {
    unsigned char out[EVP_MAX_MD_SIZE];
    unsigned int size = 0;
    if (!Crypto().HMAC(Digest(protocol), key.data(), static_cast<int>(key.size()),
                       reinterpret_cast<const unsigned char*>(message.data()), message.size(), out,
                       &size) ||
        size < 12) {
        throw std::runtime_error("HMAC failed");
    }
    return std::string(reinterpret_cast<char*>(out), 12);
}

std::string AesCfb128(bool encrypt, std::string_view key, std::string_view iv,
                      std::string_view data) {
    if (key.size() < 16 || iv.size() != 16) throw std::invalid_argument("bad AES key or IV");
    const Libcrypto& crypto = Crypto();
    std::unique_ptr<EVP_CIPHER_CTX, decltype(&EVP_CIPHER_CTX_free)> context(
        crypto.EVP_CIPHER_CTX_new(), crypto.EVP_CIPHER_CTX_free);
    std::string out(data.size() + 16, '\0');
    int written = 0;
    int final = 0;
    auto* output = reinterpret_cast<unsigned char*>(out.data());
    if (!context ||
        crypto.EVP_CipherInit_ex(context.get(), crypto.EVP_aes_128_cfb128(), nullptr,
                                 reinterpret_cast<const unsigned char*>(key.data()),
                                 reinterpret_cast<const unsigned char*>(iv.data()),
                                 encrypt ? 1 : 0) != 1 ||
        crypto.EVP_CipherUpdate(context.get(), output, &written,
                                reinterpret_cast<const unsigned char*>(data.data()),
                                static_cast<int>(data.size())) != 1 ||
        crypto.EVP_CipherFinal_ex(context.get(), output + written, &final) != 1) {
        throw std::runtime_error("AES-128-CFB failed");
    }
    out.resize(static_cast<size_t>(written + final));
    return out;
}

std::string RandomBytes(size_t count) {
    std::string bytes(count, '\0');
    if (Crypto().RAND_bytes(reinterpret_cast<unsigned char*>(bytes.data()),
                            static_cast<int>(count)) != 1) {
        throw std::runtime_error("no random bytes available");
    }
    return bytes;
}

std::string ToHex(std::string_view bytes) {
    static const char kDigits[] = "0123456789abcdef";
    std::string hex;
    hex.reserve(bytes.size() * 2);
    for (const char byte : bytes) {
        hex += kDigits[(static_cast<uint8_t>(byte) >> 4) & 0xf];
        hex += kDigits[static_cast<uint8_t>(byte) & 0xf];
    }
    return hex;
}

std::optional<std::string> FromHex(std::string_view hex) {
    if (hex.size() % 2 != 0) return std::nullopt;
    auto digit = [](char c) -> int {
        if (c >= '0' && c <= '9') return c - '0';
        if (c >= 'a' && c <= 'f') return c - 'a' + 10;
        if (c >= 'A' && c <= 'F') return c - 'A' + 10;
        return -1;
    };
    std::string bytes;
    bytes.reserve(hex.size() / 2);
    for (size_t i = 0; i < hex.size(); i += 2) {
        const int high = digit(hex[i]);
        const int low = digit(hex[i + 1]);
        if (high < 0 || low < 0) return std::nullopt;
        bytes += static_cast<char>(high * 16 + low);
    }
    return bytes;
}

}  // namespace BrixSim::Snmp
