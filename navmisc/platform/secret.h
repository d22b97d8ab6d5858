// Protection of short secrets (the web-service password) kept in settings files.
//
// A secret is sealed with XSalsa20-Poly1305 (libsodium's secretbox) under a 256-bit key that
// lives in a file of its own, readable by the user only, outside the data folder:
// $NAVMISC_KEY_FILE, else $XDG_CONFIG_HOME/navmisc/secret.key, else ~/.config/navmisc/secret.key.
// The stored text is "v1:" followed by the base64 of nonce (24 bytes) and sealed box. See
// docs/profile-keys.md for what this protects against and what it does not.
#pragma once

#include "navmisc/platform/cstring.h"

namespace navmisc {

// The stored form of `clear`; empty when `clear` is empty or no key can be had.
CString ProtectSecret(const CString& clear);
// The clear text of a stored form. False (and `clear` emptied) when the text is malformed, was
// altered, or was sealed under another key.
bool UnprotectSecret(const CString& stored, CString& clear);
// Where the key is kept.
CString SecretKeyPath();

}  // namespace navmisc
