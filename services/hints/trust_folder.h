// TrustFolder: what the administrator keeps about the issuers of the cards that people log in with.
//
//   anchors/        certificates of issuers that are trusted
//   intermediates/  certificates of issuers between those and a card's own
//   revoked/        lists of certificates that count no more
//
// Shapes:    a file holds any number in PEM or one in DER, and its name does not matter. What
//            counts is in owned_files.h.
// Threads:   one. Blocking: for the disk; a look costs one lstat() a file, and reads only after a
//            change.
// Errors:    what does not count is a line in the log when it is read. A revocation list that does
//            not count spoils them all: it may be the one that matters.
// In tests:  tests/unit/services/trust/trust_folder_test.cpp

#pragma once

#include <optional>
#include <string>
#include <vector>

#include "services/hints/owned_files.h"
#include "services/hints/tokens/openssl_handles.h"

namespace vlm::service {

struct TrustFiles {
    std::vector<X509Handle> anchors;
    std::vector<X509Handle> intermediates;
    std::vector<RevocationList> lists;
    // Why a revocation list does not count; empty when all of them do.
    std::string unusableList;
};

class TrustFolder {
public:
    static constexpr const char* kUsualPath = "/etc/vlm/trust";

    explicit TrustFolder(std::string path = kUsualPath, uid_t owner = 0)
        : _path(std::move(path)), _owner(owner) {}

    // Reads the files when they have changed since the last time, or may have; whether it did.
    bool refresh();

    const TrustFiles& files() const { return _files; }

private:
    void read();

    const std::string _path;
    const uid_t _owner;
    std::optional<FileStamps> _stamps;
    TrustFiles _files;
};

}  // namespace vlm::service
