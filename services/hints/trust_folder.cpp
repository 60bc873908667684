#include "services/hints/trust_folder.h"

#include <openssl/pem.h>

#include <algorithm>
#include <array>
#include <memory>
#include <string_view>
#include <utility>

#include "platform/harmless_text.h"
#include "platform/text.h"
#include "services/hints/hints_log.h"

namespace vlm::service {

namespace {

using platform::Bytes;
using BioHandle = std::unique_ptr<BIO, OpensslFree<BIO_free>>;

constexpr std::array kFolders = {"anchors", "intermediates", "revoked"};

struct PemPart {
    std::string name;
    Bytes der;
};

// The next part; none at the end, and for one that is broken.
std::optional<PemPart> nextPart(BIO* text) {
    char* name = nullptr;
    char* header = nullptr;
    unsigned char* data = nullptr;
    long size = 0;
    if (PEM_read_bio(text, &name, &header, &data, &size) != 1) return std::nullopt;
    PemPart part{name, Bytes(data, data + size)};
    OPENSSL_free(name);
    OPENSSL_free(header);
    OPENSSL_free(data);
    return part;
}

bool isAtEnd() { return ERR_GET_REASON(ERR_peek_last_error()) == PEM_R_NO_START_LINE; }

// The parts of a file, in DER, that are called so in PEM; none for a file that is broken.
std::optional<std::vector<Bytes>> partsOf(const Bytes& content, std::string_view kind) {
    constexpr std::string_view kBegin = "-----BEGIN ";
    if (std::search(content.begin(), content.end(), kBegin.begin(), kBegin.end()) == content.end())
        return std::vector<Bytes>{content};
    const BioHandle text(BIO_new_mem_buf(content.data(), static_cast<int>(content.size())));
    std::vector<Bytes> parts;
    while (auto part = text ? nextPart(text.get()) : std::nullopt)
        if (part->name == kind) parts.push_back(std::move(part->der));
    if (!text || !isAtEnd()) return std::nullopt;
    return parts;
}

// What is in the files, parsed; `tell` is told why one is not, by path.
template <typename Handle, typename Decode, typename Tell>
std::vector<Handle> decodeAll(const OwnedFiles& files, std::string_view kind, Decode decode,
                              Tell tell) {
    const QuietErrors quiet;
    std::vector<Handle> found;
    for (const auto& [path, content] : files.contents) {
        const auto parts = partsOf(content, kind);
        bool isWhole = parts && !parts->empty();
        for (const Bytes& der : parts.value_or(std::vector<Bytes>{})) {
            const unsigned char* at = der.data();
            Handle handle(decode(nullptr, &at, static_cast<long>(der.size())));
            if (handle && at == der.data() + der.size())
                found.push_back(std::move(handle));
            else
                isWhole = false;
        }
        if (!isWhole)
            tell(
                platform::text("{} holds something else than what belongs here, or is "
                               "broken",
                               platform::harmlessText(path)));
    }
    for (const auto& problem : files.problems) tell(problem);
    return found;
}

}  // namespace

bool TrustFolder::refresh() {
    // The stamps first: what changes while the files are read shows at the next look.
    FileStamps now;
    addStamps(_path, now);
    for (const auto* folder : kFolders) addStamps(_path + "/" + folder, now);
    const bool isSettled =
        std::ranges::all_of(now, [](const auto& each) { return each.second.has_value(); });
    if (isSettled && _stamps == now) return false;
    _stamps = std::move(now);
    read();
    return true;
}

void TrustFolder::read() {
    const auto log = [](const std::string& problem) { kLog.error("{}", problem); };
    _files = {};
    // The folder around them holds no files of its own, but who may write it can put others there.
    if (const auto problem = distrustOfFolder(_path, _owner)) {
        log(*problem);
        _files.unusableList = *problem;
        return;
    }
    const auto filesIn = [this](const char* folder) {
        return readOwnedFiles(_path + "/" + folder, _owner);
    };
    _files.anchors = decodeAll<X509Handle>(filesIn("anchors"), PEM_STRING_X509, d2i_X509, log);
    _files.intermediates =
        decodeAll<X509Handle>(filesIn("intermediates"), PEM_STRING_X509, d2i_X509, log);
    _files.lists = decodeAll<RevocationList>(filesIn("revoked"), PEM_STRING_X509_CRL, d2i_X509_CRL,
                                             [this, &log](const std::string& problem) {
                                                 log(problem);
                                                 _files.unusableList = problem;
                                             });
}

}  // namespace vlm::service
