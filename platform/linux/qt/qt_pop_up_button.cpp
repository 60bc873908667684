#include "platform/linux/qt/qt_pop_up_button.h"

#include "platform/linux/qt/text.h"

namespace vlm::platform::qt {

void QtPopUpButton::removeAllItems() {
    _items.clear();
    _box->clear();
}

void QtPopUpButton::append(const MenuItem& item) {
    _items.push_back(item);
    if (item.isSeparator)
        _box->insertSeparator(_box->count());
    else
        addTitle(shownText(item.title));
    if (_items.size() == 1) _box->setCurrentIndex(0);  // also a separator
    _box->updateGeometry();
}

// A tool tip interprets what looks like markup, and so gets titles in markup.
void QtPopUpButton::addTitle(const QString& title) {
    _box->addItem(title);
    _box->setItemData(_box->count() - 1, "<span>" + title.toHtmlEscaped() + "</span>",
                      Qt::ToolTipRole);
}

std::optional<MenuItem> QtPopUpButton::selectedItem() const {
    const int index = _box->currentIndex();
    if (index < 0) return std::nullopt;
    return _items.at(static_cast<std::size_t>(index));
}

}  // namespace vlm::platform::qt
