#include "services/hints/pinentry_dialog.h"

#include <algorithm>
#include <charconv>
#include <utility>

#include "platform/harmless_text.h"
#include "platform/text.h"

namespace vlm::service {

namespace {

constexpr const char* kConfirm = "CONFIRM";
constexpr const char* kGetPin = "GETPIN";

// The low half of an error number is the error, the rest tells which program made it.
constexpr unsigned kErrorMask = 0xFFFF;
constexpr unsigned kTimedOut = 62;
constexpr unsigned kCancelled = 99;
constexpr unsigned kNotConfirmed = 114;
constexpr unsigned kFullyCancelled = 198;

std::string escaped(std::string_view text) {
    std::string line;
    for (const char each : text) {
        if (each == '%')
            line += "%25";
        else if (each == '\n')
            line += "%0A";
        else if (each == '\r')
            line += "%0D";
        else
            line += each;
    }
    return line;
}

// One word of a line, taken off its head.
std::string_view takeWord(std::string_view& line) {
    const auto end = std::min(line.find(' '), line.size());
    const auto word = line.substr(0, end);
    line.remove_prefix(std::min(end + 1, line.size()));
    return word;
}

int hexadecimalDigit(char digit) {
    if (digit >= '0' && digit <= '9') return digit - '0';
    if (digit >= 'A' && digit <= 'F') return digit - 'A' + 10;
    if (digit >= 'a' && digit <= 'f') return digit - 'a' + 10;
    return -1;
}

}  // namespace

PinentryDialog::PinentryDialog(const PinentryForm& form,
                               const std::optional<PinentryTerminal>& terminal)
    : _mostBytes(std::min(form.mostBytes, _typed.size())), _asksTwice(!form.repeatPrompt.empty()) {
    if (terminal) {
        _commands.push_back("OPTION ttyname=" + escaped(terminal->path));
        _commands.push_back("OPTION ttytype=" + escaped(terminal->type));
    }
    _commands.push_back("OPTION lc-ctype=C.UTF-8");
    _commands.push_back(platform::text("SETTIMEOUT {}", form.patience.count()));
    _commands.push_back("SETTITLE " + escaped(form.title));
    if (!form.warning.empty()) {
        _commands.push_back("SETDESC " + escaped(form.warning));
        _commands.emplace_back(kConfirm);
    }
    _commands.push_back("SETDESC " + escaped(form.description));
    _commands.push_back("SETPROMPT " + escaped(form.prompt));
    if (!form.error.empty()) _commands.push_back("SETERROR " + escaped(form.error));
    if (_asksTwice) {
        _commands.push_back("SETREPEAT " + escaped(form.repeatPrompt));
        _commands.emplace_back("SETREPEATERROR The two differ. Try again.");
    }
    _commands.emplace_back(kGetPin);
}

PinentryDialog::~PinentryDialog() { wipeMemory(_typed); }

std::string PinentryDialog::take(std::string_view line) {
    if (_isOver) return {};
    const auto word = takeWord(line);
    const bool isAsked = _sent == _commands.size();
    if (word == "D" && isAsked) collect(line);
    if (word == "S" && isAsked && line == "PIN_REPEATED") _wasRepeated = true;
    if (word == "OK") {
        if (!isAsked) return next();
        endWithWhatWasTyped();
    }
    if (word == "ERR") {
        // A program that does not know an option asks all the same; but not what it must not ask
        // without a yes.
        const bool isConfirming = _sent > 0 && _commands[_sent - 1] == kConfirm;
        if (!isAsked && _sent > 0 && !isConfirming) return next();
        endWithError(line);
    }
    if (word == "INQUIRE") return "CAN\n";
    return {};
}

void PinentryDialog::breakOff(const std::string& reason) {
    if (!_isOver) end(PinAnswer::Outcome::Unavailable, reason);
}

PinAnswer PinentryDialog::takeAnswer() { return std::move(_answer); }

std::string PinentryDialog::next() { return _commands[_sent++] + "\n"; }

void PinentryDialog::collect(std::string_view data) {
    for (std::size_t at = 0; at < data.size(); ++at) {
        char each = data[at];
        if (each == '%' && at + 2 < data.size()) {
            const int high = hexadecimalDigit(data[at + 1]);
            const int low = hexadecimalDigit(data[at + 2]);
            if (high >= 0 && low >= 0) {
                each = static_cast<char>(high * 16 + low);
                at += 2;
            }
        }
        if (_typedSize == _mostBytes) {
            _isTooLong = true;
            return;
        }
        _typed[_typedSize++] = each;
    }
}

void PinentryDialog::endWithWhatWasTyped() {
    if (_isTooLong) return end(PinAnswer::Outcome::Unavailable, "what was entered is too long");
    if (_asksTwice && !_wasRepeated && _typedSize > 0)
        return end(PinAnswer::Outcome::Unavailable, "the pinentry program does not ask twice");
    end(PinAnswer::Outcome::Given);
}

void PinentryDialog::end(PinAnswer::Outcome outcome, std::string reason) {
    _isOver = true;
    _answer.outcome = outcome;
    _answer.reason = std::move(reason);
    if (outcome != PinAnswer::Outcome::Given) return;
    _answer.reason.clear();
    // Nothing was typed: no card has such a PIN, and for a card it means that its reader asks; and
    // no keyring that is shut has such a password.
    if (_typedSize == 0)
        _answer.outcome = PinAnswer::Outcome::Cancelled;
    else
        _answer.pin = Secret(std::string_view(_typed.data(), _typedSize));
}

void PinentryDialog::endWithError(std::string_view error) {
    unsigned number = 0;
    const auto word = takeWord(error);
    std::from_chars(word.data(), word.data() + word.size(), number);
    switch (number & kErrorMask) {
        case kCancelled:
        case kFullyCancelled:
        case kNotConfirmed:
            return end(PinAnswer::Outcome::Cancelled);
        case kTimedOut:
            return end(PinAnswer::Outcome::TimedOut);
        default:
            end(PinAnswer::Outcome::Unavailable,
                platform::text("the pinentry program failed: {}", platform::harmlessText(error)));
    }
}

}  // namespace vlm::service
