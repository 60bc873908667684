// Snapshot: a cell for a value that several threads share and one whole version of which is read
// at a time.
//
// Shapes:    the value may be absent, which is not the same as empty.
// Ownership: a reader shares the version that it got, and that version never changes.
// Threads:   any; a change is one step, and no version ever shows half of one.
// Blocking:  a reader waits for a change that is being made; changes wait for one another.
// In tests:  tests/unit/bind/snapshot_test.cpp

#pragma once

#include <memory>
#include <mutex>
#include <optional>
#include <utility>

namespace vlm {

template <typename Value>
class Snapshot {
public:
    // The present version; null when the value is absent.
    std::shared_ptr<const Value> get() const {
        const std::lock_guard lock(_mutex);
        return _value;
    }

    void set(std::optional<Value> value) {
        auto published = value ? std::make_shared<const Value>(std::move(*value)) : nullptr;
        const std::lock_guard lock(_mutex);
        _value.swap(published);
    }

    // Lets `change` edit a copy of the value, held by a pointer that is null when it is absent and
    // may become so, and publishes what comes of it. `change` must not come back to this cell.
    template <typename Change>
    void update(Change&& change) {
        std::shared_ptr<const Value> replaced;  // given up only after the mutex
        const std::lock_guard lock(_mutex);
        auto edited = _value ? std::make_shared<Value>(*_value) : nullptr;
        std::forward<Change>(change)(edited);
        replaced = std::exchange(_value, std::move(edited));
    }

private:
    mutable std::mutex _mutex;
    std::shared_ptr<const Value> _value;  // read and replaced by any thread, under the mutex
};

}  // namespace vlm
