// list_tokens [USER]: the names of the inserted cards, and whether the user is paired with one.

#include <hints/hints_client.h>

#include <iostream>

using vlm::platform::PropertyList;

namespace {

// The service's answer holds the token record as one more property list, under "ctx".
std::optional<PropertyList> tokenRecord() {
    const auto answer = VLCopyAvailableTokensInfo(0, std::nullopt);
    const auto* entries = answer ? answer->dictionary() : nullptr;
    const auto* context = entries ? entries->find("ctx") : nullptr;
    const auto* data = context ? context->bytes() : nullptr;
    return data ? vlm::platform::readPropertyList(*data) : std::nullopt;
}

void printCards(const PropertyList& record) {
    const auto* entries = record.dictionary();
    const auto* names = entries ? entries->find("ftn") : nullptr;
    const auto* nameByToken = names ? names->dictionary() : nullptr;
    if (!nameByToken || nameByToken->empty()) {
        std::cout << "No card is inserted.\n";
        return;
    }
    for (const auto& [token, name] : *nameByToken) std::cout << name.describe() << '\n';
}

}  // namespace

int main(int argc, char* argv[]) {
    const auto record = tokenRecord();
    if (!record) {
        std::cerr << "The hints service gave no answer.\n";
        return 1;
    }
    printCards(*record);
    if (argc > 1)
        std::cout << argv[1] << (VLIsUserBound(argv[1]) ? " is paired.\n" : " is not paired.\n");
    return 0;
}
