#include "services/vlmctl/configuration_file.h"

#include "platform/property_list.h"
#include "services/vlmctl/read_file.h"

namespace vlm::control {

bool configurationMapsUsers() {
    const auto content = readFile(kConfigurationFile, platform::PropertyListLimits().bytes);
    const auto list = content.bytes ? platform::readPropertyList(*content.bytes) : std::nullopt;
    return list && list->dictionary() && list->dictionary()->contains(kAttributeMapping);
}

}  // namespace vlm::control
