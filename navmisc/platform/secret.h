// Protection of short secrets (the web-service password) kept in settings files.
//
// A secret is sealed with XSalsa20-Poly1305 (libsodium's secretbox) under a 256-bit key that
// lives in a file of its own, readable by the user only, outside the data folder:
// $NAVMISC_KEY_FILE, else $XDG_CONFIG_HOME/navmisc/secret.key, else ~/.config/navmisc/secret.key
// ($HOME, else the account's home folder). Folders it creates get mode 0700; a key folder that
// belongs to another user or that others may write to is refused (LastFileRefusal says why).
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
// Where the key is kept; empty when there is no safe place (no HOME and no home folder).
CString SecretKeyPath();

}  // namespace navmisc
