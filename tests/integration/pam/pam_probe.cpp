// pam_probe FOLDER SERVICE [WORD...]: a program that lets people in by PAM, for tests.
//
//   user=NAME      names the user; nobody is named without it
//   name=NAME      what the person answers when asked for the name
//   pin=TEXT       what the person answers to the next question without echo; no such word left:
//                  the application fails
//   tty=NAME rhost=NAME env=NAME=VALUE
//   account session password   calls these parts, too
//   times=N        all of it so many times, each with a transaction of its own
//   closed         works without the streams 0 to 2, and writes to descriptor 9
//   small-stack    works on a thread with a stack of 64 KiB
//
// Prints what PAM asks and tells, and the value of each call; at the end how many descriptors and
// threads are left, and whether a signal is handled otherwise than before.

#include <pthread.h>
#include <security/pam_appl.h>
#include <signal.h>
#include <unistd.h>

#include <algorithm>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <string>
#include <string_view>
#include <vector>

namespace {

struct Person {
    std::vector<std::string> words;
    int out = STDOUT_FILENO;

    std::string value(const std::string& key, const std::string& otherwise = "") const {
        for (const auto& word : words)
            if (word.starts_with(key + "=")) return word.substr(key.size() + 1);
        return otherwise;
    }
    bool has(const std::string& word) const {
        return std::ranges::find(words, word) != words.end();
    }
    void print(const std::string& line) const {
        const auto text = line + "\n";
        if (write(out, text.data(), text.size()) < 0) std::abort();
    }
    // The answer, taken away; null when there is none left.
    char* take(const std::string& key) {
        const auto found = std::ranges::find_if(
            words, [&](const auto& word) { return word.starts_with(key + "="); });
        if (found == words.end()) return nullptr;
        char* answer = strdup(found->c_str() + key.size() + 1);
        words.erase(found);
        return answer;
    }
};

int converse(int count, const pam_message** messages, pam_response** responses, void* person) {
    auto& self = *static_cast<Person*>(person);
    auto* made =
        static_cast<pam_response*>(calloc(static_cast<std::size_t>(count), sizeof(**responses)));
    bool hasAnswered = true;
    for (int each = 0; each < count; ++each) {
        const int style = messages[each]->msg_style;
        const std::string text = messages[each]->msg;
        if (style == PAM_TEXT_INFO || style == PAM_ERROR_MSG) {
            self.print((style == PAM_TEXT_INFO ? "info: " : "error: ") + text);
            continue;
        }
        self.print((style == PAM_PROMPT_ECHO_OFF ? "hidden: " : "shown: ") + text);
        made[each].resp = self.take(style == PAM_PROMPT_ECHO_OFF ? "pin" : "name");
        hasAnswered = hasAnswered && made[each].resp;
    }
    if (!hasAnswered) return free(made), PAM_CONV_ERR;
    *responses = made;
    return PAM_SUCCESS;
}

void letIn(Person person, const char* folder, const char* service) {
    const pam_conv conversation{converse, &person};
    const auto user = person.value("user");
    pam_handle_t* handle = nullptr;
    if (pam_start_confdir(service, user.empty() ? nullptr : user.c_str(), &conversation, folder,
                          &handle) != PAM_SUCCESS)
        return person.print("pam_start failed");
    for (const auto& [key, item] : {std::pair("tty", PAM_TTY), std::pair("rhost", PAM_RHOST)})
        if (const auto value = person.value(key); !value.empty())
            pam_set_item(handle, item, value.c_str());
    if (const auto variable = person.value("env"); !variable.empty())
        pam_putenv(handle, variable.c_str());

    int result = pam_authenticate(handle, 0);
    person.print("authenticate " + std::to_string(result));
    if (result == PAM_SUCCESS) {
        const void* name = nullptr;
        pam_get_item(handle, PAM_USER, &name);
        person.print(std::string("user ") + (name ? static_cast<const char*>(name) : "(none)"));
        person.print("setcred " + std::to_string(pam_setcred(handle, PAM_ESTABLISH_CRED)));
    }
    if (person.has("account")) person.print("account " + std::to_string(pam_acct_mgmt(handle, 0)));
    if (person.has("session")) {
        person.print("session " + std::to_string(pam_open_session(handle, 0)));
        pam_close_session(handle, 0);
    }
    if (person.has("password"))
        person.print("password " + std::to_string(pam_chauthtok(handle, 0)));
    pam_end(handle, result);
}

std::ptrdiff_t entriesOf(const char* folder) {
    return std::distance(std::filesystem::directory_iterator(folder), {});
}

std::string signalsHandled() {
    std::string all;
    for (int number = 1; number < NSIG; ++number) {
        struct sigaction action {};
        if (sigaction(number, nullptr, &action) < 0) continue;
        all += std::to_string(number) + (action.sa_handler == SIG_DFL ? "d " : "h ");
    }
    sigset_t blocked;
    pthread_sigmask(SIG_SETMASK, nullptr, &blocked);
    for (int number = 1; number < NSIG; ++number)
        all += sigismember(&blocked, number) == 1 ? "b" : ".";
    return all;
}

struct Work {
    Person person;
    const char* folder;
    const char* service;

    void run() const {
        const int times = std::atoi(person.value("times", "1").c_str());
        for (int each = 0; each < times; ++each) letIn(person, folder, service);
    }
    static void* runFrom(void* self) {
        static_cast<Work*>(self)->run();
        return nullptr;
    }
};

void runOnSmallStack(Work& work) {
    pthread_attr_t attributes;
    pthread_attr_init(&attributes);
    pthread_attr_setstacksize(&attributes, 64 << 10);
    pthread_t thread;
    if (pthread_create(&thread, &attributes, Work::runFrom, &work) != 0) std::abort();
    pthread_join(thread, nullptr);
    pthread_attr_destroy(&attributes);
}

}  // namespace

int main(int argc, char* argv[]) {
    if (argc < 3) return 64;
    Work work{{{argv + 3, argv + argc}}, argv[1], argv[2]};
    if (work.person.has("closed")) {
        work.person.out = dup2(STDOUT_FILENO, 9);
        for (const int stream : {0, 1, 2}) close(stream);
    }
    const auto descriptors = entriesOf("/proc/self/fd");
    const auto signals = signalsHandled();
    work.person.has("small-stack") ? runOnSmallStack(work) : work.run();
    work.person.print("more descriptors " +
                      std::to_string(entriesOf("/proc/self/fd") - descriptors));
    work.person.print("threads " + std::to_string(entriesOf("/proc/self/task")));
    work.person.print(signalsHandled() == signals ? "signals as before" : "signals differ");
}
