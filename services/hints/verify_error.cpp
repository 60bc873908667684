#include "services/hints/verify_error.h"

#include <openssl/x509_vfy.h>

namespace vlm::service {

std::string verifyErrorText(int error, int depth) {
    const bool isItself = depth == 0;
    switch (error) {
        case X509_V_ERR_CERT_HAS_EXPIRED:
            return isItself ? "it has expired" : "the certificate of an issuer has expired";
        case X509_V_ERR_CERT_NOT_YET_VALID:
            return isItself ? "it is not yet valid"
                            : "the certificate of an issuer is not yet valid";
        case X509_V_ERR_DEPTH_ZERO_SELF_SIGNED_CERT:
            return "it is self-signed, and no anchor of this machine";
        case X509_V_ERR_SELF_SIGNED_CERT_IN_CHAIN:
        case X509_V_ERR_UNABLE_TO_GET_ISSUER_CERT:
        case X509_V_ERR_UNABLE_TO_GET_ISSUER_CERT_LOCALLY:
        case X509_V_ERR_UNABLE_TO_VERIFY_LEAF_SIGNATURE:
        case X509_V_ERR_CERT_CHAIN_TOO_LONG:
            return "no path leads from it to an issuer that this machine trusts";
        case X509_V_ERR_INVALID_CA:
        case X509_V_ERR_INVALID_NON_CA:
        case X509_V_ERR_PATH_LENGTH_EXCEEDED:
        case X509_V_ERR_KEYUSAGE_NO_CERTSIGN:
        case X509_V_ERR_PERMITTED_VIOLATION:
        case X509_V_ERR_EXCLUDED_VIOLATION:
            return "an issuer on its path had no right to issue it";
        case X509_V_ERR_CERT_SIGNATURE_FAILURE:
            return "its issuer did not sign it";
        case X509_V_ERR_CERT_REVOKED:
            return isItself ? "it has been revoked"
                            : "the certificate of an issuer has been revoked";
        case X509_V_ERR_CRL_HAS_EXPIRED:
            return "the revocation list of its issuer is too old";
        case X509_V_ERR_CRL_NOT_YET_VALID:
        case X509_V_ERR_CRL_SIGNATURE_FAILURE:
        case X509_V_ERR_UNABLE_TO_GET_CRL:
        case X509_V_ERR_UNABLE_TO_GET_CRL_ISSUER:
        case X509_V_ERR_KEYUSAGE_NO_CRL_SIGN:
        case X509_V_ERR_UNHANDLED_CRITICAL_CRL_EXTENSION:
        case X509_V_ERR_ERROR_IN_CRL_LAST_UPDATE_FIELD:
        case X509_V_ERR_ERROR_IN_CRL_NEXT_UPDATE_FIELD:
            return "the revocation list of its issuer cannot be relied on";
        case X509_V_ERR_EE_KEY_TOO_SMALL:
        case X509_V_ERR_CA_KEY_TOO_SMALL:
        case X509_V_ERR_CA_MD_TOO_WEAK:
            return isItself ? "its key or signature is too weak"
                            : "the key or signature of an issuer is too weak";
        default:
            return X509_verify_cert_error_string(error);
    }
}

}  // namespace vlm::service
