// The hints service's own status numbers, as a reply's "res" carries them, each with an error text.
// 0 is success. The client's own numbers (-1000 to -1003) and the pairing's -8 are left free.

#pragma once

#include "platform/types.h"

namespace vlm::service::status {

using platform::Status;

inline constexpr Status kSuccess = 0;
inline constexpr Status kBadRequest = -2000;    // a key is missing, of a wrong type or too long
inline constexpr Status kNotPermitted = -2001;  // the caller may not do this
inline constexpr Status kNotServed = -2002;     // this instance does not serve this operation
inline constexpr Status kNoSuchAccount = -2003;
inline constexpr Status kNoSuchToken = -2004;  // the token is not inserted
inline constexpr Status kNoSuchKey = -2005;    // the token holds no such identity that can sign
inline constexpr Status kNoPin = -2006;        // no PIN was given and nobody could be asked
inline constexpr Status kCancelled = -2007;    // the person dismissed what was asked, or left it
inline constexpr Status kPinIncorrect = -2008;
inline constexpr Status kPinLocked = -2009;
inline constexpr Status kCardFailed = -2010;  // the card, its reader or its module failed
inline constexpr Status kNotProved = -2011;   // no valid signature by the key was given
inline constexpr Status kNotPaired = -2012;
inline constexpr Status kStoreFailed = -2013;   // the pairings could not be read or written
inline constexpr Status kUnreachable = -2014;   // the daemon does not answer the user's instance
inline constexpr Status kBusy = -2015;          // too many requests wait for an answer already
inline constexpr Status kUnattended = -2016;    // nobody can be asked in the caller's session
inline constexpr Status kRightUnknown = -2017;  // whether an administrator allows it is not known
inline constexpr Status kNoLoginCard = -2018;   // no card to log in with; the password is asked for
inline constexpr Status kCardRequired = -2019;  // likewise, and no other login is allowed
inline constexpr Status kCertificateRefused = -2020;  // expired, not yet valid or not trusted
inline constexpr Status kNoKeyring = -2021;           // no login keyring, or nobody there to ask
inline constexpr Status kKeyringRefused = -2022;      // the keyring did not take the password
inline constexpr Status kNoWrapKey = -2023;           // the card has no key that can wrap
inline constexpr Status kUnlockKeyShut = -2024;       // only told: the login itself is good

}  // namespace vlm::service::status
