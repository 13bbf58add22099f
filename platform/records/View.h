// View: the description of one kind of record. Everything the engine does is written once over these tables; adding a property
// is adding a row.
#pragma once

#include <cstdint>
#include <cstring>
#include <span>

namespace platform::records {

enum class Type { kInt, kLong, kText, kTime, kChildren };

struct Property {
    unsigned id;
    Type type;
    const char* column;         // NULL for children
    int64_t defaultNumber = 0;  // of numbers
    bool readOnly = false;      // only the store sets it
    const char* childView = nullptr;
};

// What a view's records are to each other.
enum class Role {
    kBook,   // holds items
    kItem,   // belongs to a book; listed in the change feed
    kChild,  // belongs to an item and has no life of its own
    kInfo,   // made by the store, in no table
};

struct FeedShape;

struct View {
    const char* uri;
    Role role;
    const char* table = nullptr;
    std::span<const Property> properties;
    unsigned idProperty = 0;

    // Items.
    unsigned bookProperty = 0;
    const char* bookView = nullptr;
    unsigned bookTypeProperty = 0;    // of the book's view
    int bookType = 0;                 // the value that a book of these items has there
    const FeedShape* feed = nullptr;  // what its change feed looks like
    unsigned filesProperty = 0;       // children whose text is the path of a file that the store keeps
    const char* onDelete = nullptr;   // SQL that goes with the deletion of an item ("old.id")

    // Items that may be exceptions of a series of the same view.
    unsigned seriesProperty = 0;
    unsigned instanceProperty = 0;  // names the instance within its series
    unsigned exceptionsProperty = 0;
    unsigned keptOnReplace = 0;  // a property of the series that a replacement keeps

    [[nodiscard]] int indexOf(unsigned property) const {
        // The tables list their properties in the order of the ids.
        const size_t expected = properties.empty() ? 0 : property - properties.front().id;
        if (expected < properties.size() && properties[expected].id == property)
            return static_cast<int>(expected);
        for (size_t i = 0; i < properties.size(); ++i) {
            if (properties[i].id == property) return static_cast<int>(i);
        }
        return -1;
    }
    [[nodiscard]] const char* columnOf(unsigned property) const {
        return properties[static_cast<size_t>(indexOf(property))].column;
    }
    [[nodiscard]] bool hasSeries() const { return seriesProperty != 0; }
    // Set once, when the record is inserted.
    [[nodiscard]] bool isFixed(unsigned property) const {
        return property == idProperty || property == bookProperty || property == seriesProperty ||
               property == instanceProperty;
    }
};

// The records of a change feed.
struct FeedShape {
    const View* view;
    unsigned id;
    unsigned book;
    unsigned change;
    unsigned version;
    unsigned syncedVersion;
    unsigned filesChanged = 0;  // 1 when the item's files were written after the version asked for
};

inline bool isSame(const char* a, const char* b) {
    return std::strcmp(a, b) == 0;
}

}  // namespace platform::records
