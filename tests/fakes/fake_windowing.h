// A desktop in memory: windows that a test describes, looks at and clicks on.

#pragma once

#include <cassert>
#include <map>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "fake_window_parts.h"
#include "platform/windowing.h"

namespace vlm::fakes {

// What is on the screen of one window. It stays to be looked at when the window was let go.
class FakeScreenWindow {
public:
    // What a description says.
    FakeView content{"content"};
    std::string closeButton;  // clicked by the window's own close button

    // What a test looks at.
    bool shown = false;
    bool closed = false;
    int level = 0;
    std::vector<platform::Alert> sheets;  // those on the window now

    // What a person does. A click that reaches no working button does nothing and answers false;
    // what it calls may let the window go.
    bool click(std::string_view name) {
        auto* button = content.find<FakeButton>(name);
        if (!button || !button->enabled || !button->action || !shown || !sheets.empty())
            return false;
        const auto action = button->action;
        action();
        return true;
    }
    bool clickClose() { return click(closeButton); }

    void dismissSheet() {
        assert(!sheets.empty());
        sheets.pop_back();
        const auto dismissed = std::move(_dismissals.back());
        _dismissals.pop_back();
        dismissed();
    }

    // What the program does.
    void attach(const platform::Alert& alert, std::function<void()> dismissed) {
        sheets.push_back(alert);
        _dismissals.push_back(std::move(dismissed));
    }
    void close() {
        shown = false;
        closed = true;
        sheets.clear();
        _dismissals.clear();
    }

private:
    std::vector<std::function<void()>> _dismissals;  // one for each sheet
};

class FakeWindowing final : public platform::Windowing {
public:
    using Description = std::function<void(FakeScreenWindow&)>;

    // What a test does to the world.
    void describe(const std::string& name, Description description) {
        _descriptions[name] = std::move(description);
    }

    // Windows in the order in which they were loaded.
    std::vector<std::shared_ptr<FakeScreenWindow>> windows;

    // What was done to windows and to the program, oldest first: "load NAME", "level N", "centre",
    // "key", "activate", "close".
    std::vector<std::string> record;

    // Windowing:
    std::unique_ptr<platform::Window> loadWindow(std::string_view description) override {
        record.push_back("load " + std::string(description));
        const auto found = _descriptions.find(std::string(description));
        if (found == _descriptions.end() || !found->second) return nullptr;
        windows.push_back(std::make_shared<FakeScreenWindow>());
        found->second(*windows.back());
        return std::make_unique<FakeWindow>(windows.back(), record);
    }
    void activateIgnoringOthers() override { record.emplace_back("activate"); }

private:
    class FakeWindow final : public platform::Window {
    public:
        FakeWindow(std::shared_ptr<FakeScreenWindow> screen, std::vector<std::string>& record)
            : _screen(std::move(screen)), _record(record) {}
        ~FakeWindow() override { _screen->close(); }

        platform::View& contentView() override { return _screen->content; }
        platform::PopUpButton* popUpButton(std::string_view name) override {
            return _screen->content.find<FakePopUpButton>(name);
        }
        platform::IconView* iconView(std::string_view name) override {
            return _screen->content.find<FakeIconView>(name);
        }
        platform::TextLabel* textLabel(std::string_view name) override {
            return _screen->content.find<FakeTextLabel>(name);
        }
        void onClick(std::string_view button, std::function<void()> action) override {
            if (auto* found = _screen->content.find<FakeButton>(button))
                found->action = std::move(action);
        }
        void setLevel(int level) override {
            _screen->level = level;
            _record.push_back("level " + std::to_string(level));
        }
        void centre() override { _record.emplace_back("centre"); }
        void makeKeyAndOrderFront() override {
            _screen->shown = !_screen->closed;
            _record.emplace_back("key");
        }
        void showSheet(const platform::Alert& alert, std::function<void()> dismissed) override {
            if (!_screen->closed) _screen->attach(alert, std::move(dismissed));
        }
        void close() override {
            if (!_screen->closed) _record.emplace_back("close");
            _screen->close();
        }

    private:
        const std::shared_ptr<FakeScreenWindow> _screen;
        std::vector<std::string>& _record;
    };

    std::map<std::string, Description> _descriptions;
};

}  // namespace vlm::fakes
