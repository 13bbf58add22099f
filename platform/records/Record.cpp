#include "Record.h"

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

}  // namespace

Record::Record(const View& view)
    : mView(&view), mPresent(view.properties.size(), true), mChildren(view.properties.size()) {
    mValues.reserve(view.properties.size());
    for (const Property& property : view.properties) mValues.push_back(defaultOf(property));
}

std::unique_ptr<Record> Record::clone() const {
    auto copy = std::make_unique<Record>(*mView);
    copy->mValues = mValues;
    copy->mPresent = mPresent;
    copy->readExceptions = readExceptions;
    for (size_t i = 0; i < mChildren.size(); ++i) {
        for (const auto& child : mChildren[i]) copy->mChildren[i].push_back(child->clone());
    }
    return copy;
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
    for (size_t i = 0; i < mValues.size(); ++i) {
        const Property& property = mView->properties[i];
        if (property.readOnly || property.id == mView->exceptionsProperty) continue;
        if (property.type != Type::kChildren) {
            if (mValues[i] != other.mValues[i]) return false;
            continue;
        }
        if (mChildren[i].size() != other.mChildren[i].size()) return false;
        for (size_t child = 0; child < mChildren[i].size(); ++child) {
            if (!mChildren[i][child]->hasSameContent(*other.mChildren[i][child])) return false;
        }
    }
    return true;
}

}  // namespace platform::records
