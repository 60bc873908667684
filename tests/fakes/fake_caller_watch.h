#pragma once

#include <algorithm>
#include <functional>
#include <memory>
#include <set>
#include <string>
#include <utility>
#include <vector>

#include "services/hints/caller.h"

namespace vlm::fakes {

class FakeCallerWatch final : public service::CallerWatch {
public:
    // What a test does to the world: the program with this connection ends.
    void leave(const std::string& connection) {
        _gone.insert(connection);
        const auto watching = _watches;
        for (auto* watch : watching)
            if (std::ranges::find(_watches, watch) != _watches.end() &&
                watch->connection == connection)
                std::exchange(watch->left, nullptr)();
    }

    // How many watches there are.
    std::size_t watching() const { return _watches.size(); }

    std::unique_ptr<Watch> watch(const std::string& connection,
                                 std::function<void()> left) override {
        if (_gone.contains(connection)) return nullptr;
        return std::make_unique<FakeWatch>(*this, connection, std::move(left));
    }

private:
    struct FakeWatch final : Watch {
        FakeWatch(FakeCallerWatch& all, std::string name, std::function<void()> handler)
            : connection(std::move(name)), left(std::move(handler)), _all(all) {
            _all._watches.push_back(this);
        }
        FakeWatch(const FakeWatch&) = delete;
        FakeWatch& operator=(const FakeWatch&) = delete;
        ~FakeWatch() override { std::erase(_all._watches, this); }

        std::string connection;
        std::function<void()> left;

    private:
        FakeCallerWatch& _all;
    };

    std::vector<FakeWatch*> _watches;
    std::set<std::string> _gone;
};

}  // namespace vlm::fakes
