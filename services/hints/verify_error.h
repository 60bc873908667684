#pragma once

#include <string>

namespace vlm::service {

// What a code of X509_verify_cert() means for a certificate, as a clause for people; `depth` is how
// many issuers away from it the trouble is.
std::string verifyErrorText(int error, int depth);

}  // namespace vlm::service
