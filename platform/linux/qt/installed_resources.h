// Files that are installed with the program, found from its own place: ../share/vlm/KIND/FILE.

#pragma once

#include <QString>

namespace vlm::platform::qt {

// The path of the file, also when it is not there; empty for a name that leads elsewhere.
QString installedResource(const QString& kind, const QString& file);

}  // namespace vlm::platform::qt
