#include "Record.h"

#include <mutex>

namespace platform::records {

namespace {

Value defaultOf(const Property& property) {
    switch (property.type) {
        case Type::kInt:
        case Type::kLong:
        case Type::kChildren:
            return property.defaultNumber;
        case Type::kText:
            return std::string();
        case Type::kTime:
            return calendar_time_s{};
    }
    return int64_t{0};
}

// Made once for each view; views are constants.
const std::vector<Value>& defaultsOf(const View& view) {
    static std::mutex mutex;
    static std::map<const View*, std::vector<Value>> all;
    const std::lock_guard lock(mutex);
    std::vector<Value>& defaults = all[&view];
    if (defaults.empty()) {
        for (const Property& property : view.properties) defaults.push_back(defaultOf(property));
    }
    return defaults;
}

}  // namespace

Record::Record(const View& view)
    : mView(&view),
      mDefaults(&defaultsOf(view)),
      mSlots(view.properties.size(), kDefault),
      mPresent(view.properties.size(), true) {}

std::unique_ptr<Record> Record::clone() const {
    auto copy = std::make_unique<Record>(*mView);
    copy->mSlots = mSlots;
    copy->mValues = mValues;
    copy->mPresent = mPresent;
    copy->readExceptions = readExceptions;
    for (const auto& [index, children] : mChildren) {
        for (const auto& child : children) copy->mChildren[index].push_back(child->clone());
    }
    return copy;
}

void Record::setAt(size_t index, Value value) {
    mPresent[index] = true;
    if (mSlots[index] != kDefault) {
        mValues[mSlots[index]] = std::move(value);
        return;
    }
    mSlots[index] = static_cast<uint8_t>(mValues.size());
    mValues.push_back(std::move(value));
}

const Record::Children& Record::children(size_t index) const {
    static const Children kNone;
    const auto found = mChildren.find(index);
    return found != mChildren.end() ? found->second : kNone;
}

int64_t Record::number(unsigned property) const {
    const int64_t* value = get<int64_t>(property);
    return value != nullptr ? *value : 0;
}

int Record::seriesId() const {
    return mView->hasSeries() ? static_cast<int>(number(mView->seriesProperty)) : 0;
}

void Record::setNumber(unsigned property, int64_t value) {
    const int index = mView->indexOf(property);
    if (index >= 0) setAt(static_cast<size_t>(index), value);
}

bool Record::hasSameContent(const Record& other) const {
    for (size_t i = 0; i < mSlots.size(); ++i) {
        const Property& property = mView->properties[i];
        if (property.readOnly || property.id == mView->exceptionsProperty) continue;
        if (property.type != Type::kChildren) {
            if (valueAt(i) != other.valueAt(i)) return false;
            continue;
        }
        const Children& mine = children(i);
        const Children& theirs = other.children(i);
        if (mine.size() != theirs.size()) return false;
        for (size_t child = 0; child < mine.size(); ++child) {
            if (!mine[child]->hasSameContent(*theirs[child])) return false;
        }
    }
    return true;
}

std::string idArray(std::span<const int> ids) {
    std::string text = "[";
    for (const int id : ids) text.append(text.size() > 1 ? "," : "").append(std::to_string(id));
    return text + "]";
}

}  // namespace platform::records
