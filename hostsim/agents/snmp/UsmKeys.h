// SNMPv3 user-based security: password to key, key localization, HMAC-96 authentication and
// AES-128-CFB privacy (RFC 3414, RFC 3826), on OpenSSL's libcrypto. Keys are byte strings.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace BrixSim::Snmp {

enum class AuthProtocol { None, Md5, Sha1 };

// "MD5" / "SHA1" (and "SHA" as the receivers write it); nullopt for anything else.
std::optional<AuthProtocol> ParseAuthProtocol(std::string_view name);
// 16 for MD5, 20 for SHA-1.
size_t DigestSize(AuthProtocol protocol);

// Ku: the digest of one mebibyte of the password repeated.
std::string PasswordToKey(AuthProtocol protocol, std::string_view password);
// Kul = H(Ku || engineId || Ku).
std::string LocalizeKey(AuthProtocol protocol, std::string_view ku, std::string_view engineId);
// The localized key of a password, as the agent stores it.
std::string LocalizedKey(AuthProtocol protocol, std::string_view password,
                         std::string_view engineId);

// The first 12 bytes of HMAC(key, message).
std::string Hmac96(AuthProtocol protocol, std::string_view key, std::string_view message);

// AES-128 in CFB-128 mode with a 16-byte key and IV; the output is as long as the input.
std::string AesCfb128(bool encrypt, std::string_view key, std::string_view iv,
                      std::string_view data);

std::string RandomBytes(size_t count);

std::string ToHex(std::string_view bytes);
// Decodes hexadecimal digits (either case); nullopt for an odd count or another character.
std::optional<std::string> FromHex(std::string_view hex);

}  // namespace BrixSim::Snmp
