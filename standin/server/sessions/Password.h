// Passwords are kept only as yescrypt hashes, in the form of crypt(3), so that mkpasswd makes them too.
// Safe from any thread. A password ends at its first zero byte for the algorithm behind these functions,
// so one that holds a zero byte is refused; so is one of 512 bytes and more.
#pragma once

#include <string>

namespace standin::Password
{
// A new hash with a salt of its own, at the cost that the system's library takes for granted. Throws
// std::runtime_error when the password is refused or the system offers no yescrypt.
std::string Hash(std::string const& password);

// Whether that password made that hash, with the method and cost that stand in the hash. An empty or
// malformed hash belongs to no password.
bool Verify(std::string const& password, std::string const& hash);

// Takes as long as Verify does with a hash made by Hash: call it for an unknown user, so that the time of
// the answer does not tell who exists.
void VerifyNobody(std::string const& password);
}  // namespace standin::Password
