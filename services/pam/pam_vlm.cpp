// pam_vlm: logs people in with their smart card. docs/login.md says how, and what it answers.
//
// The module lives in whatever process lets people in. It brings its own copy of all that it uses,
// keeps no connection, starts no thread and touches no signal.

#include <security/pam_ext.h>
#include <security/pam_modules.h>
#include <syslog.h>

#include <exception>

#include "platform/export.h"
#include "services/pam/after_login.h"
#include "services/pam/authentication.h"
#include "services/pam/exchange.h"
#include "services/pam/options.h"
#include "services/pam/pam_transaction.h"
#include "settings/smartcard_configuration.h"
#include "settings/smartcard_settings_worker.h"

namespace {

using namespace vlm::pam;

// Asked when the service has given no answer: then everybody counts as paired, so that its failure
// opens no door.
bool requiresCard(const std::string& account) {
    const auto isBound = [](const auto&) { return true; };
    return vlm::settingForUser("enforceSmartCard", vlm::platform::String(account),
                               vlm::kSmartcardConfiguration, isBound) != 0;
}

Options optionsOf(pam_handle_t* handle, int count, const char** words) {
    auto options = readOptions(count, words);
    for (const auto& word : options.notUnderstood)
        pam_syslog(handle, LOG_ERR, "the option \"%s\" is not understood", word.c_str());
    return options;
}

// Nothing may be thrown into an application that is written in C.
template <typename Work>
int guarded(pam_handle_t* handle, int flags, int count, const char** words, Work work) {
    try {
        const auto options = optionsOf(handle, count, words);
        PamTransaction transaction(handle, (flags & PAM_SILENT) != 0, options.isDebugging);
        return work(transaction, options);
    } catch (const std::exception& failure) {
        pam_syslog(handle, LOG_ERR, "%s", failure.what());
    } catch (...) {
        pam_syslog(handle, LOG_ERR, "failed for a reason that nobody knows");
    }
    return PAM_SYSTEM_ERR;
}

template <typename Step>
int afterLogin(pam_handle_t* handle, int flags, int count, const char** words, Step step) {
    return guarded(handle, flags, count, words,
                   [&](Transaction& transaction, const Options& options) {
                       AfterLogin after{transaction, exchangeOn(options.bus), options.patience};
                       return (after.*step)();
                   });
}

}  // namespace

extern "C" {

VLM_EXPORT int pam_sm_authenticate(pam_handle_t* handle, int flags, int count, const char** words) {
    return guarded(
        handle, flags, count, words, [](Transaction& transaction, const Options& options) {
            return Authentication(
                       {transaction, exchangeOn(options.bus), options.patience, requiresCard})
                .run();
        });
}

VLM_EXPORT int pam_sm_setcred(pam_handle_t*, int, int, const char**) { return PAM_SUCCESS; }

VLM_EXPORT int pam_sm_acct_mgmt(pam_handle_t* handle, int flags, int count, const char** words) {
    return afterLogin(handle, flags, count, words, &AfterLogin::checkAccount);
}

VLM_EXPORT int pam_sm_open_session(pam_handle_t* handle, int flags, int count, const char** words) {
    return afterLogin(handle, flags, count, words, &AfterLogin::openSession);
}

VLM_EXPORT int pam_sm_close_session(pam_handle_t*, int, int, const char**) { return PAM_SUCCESS; }

VLM_EXPORT int pam_sm_chauthtok(pam_handle_t* handle, int flags, int count, const char** words) {
    // Whether the password may be changed is for others to say.
    if ((flags & PAM_PRELIM_CHECK) != 0) return PAM_SUCCESS;
    return afterLogin(handle, flags, count, words, &AfterLogin::changePassword);
}

}  // extern "C"
