#pragma once

namespace vlm {

// Confines this process for good to what the tool's own profile allows. False, with the reason in
// the log, when that is not possible; the process must not go on then.
bool initSandbox();

}  // namespace vlm
