// CtTransaction: a transaction of the calling thread over the contacts service, undone unless commit() was called.
#pragma once

#include "platform/contacts.h"

class CtTransaction {
public:
    CtTransaction() : mBegun(contacts_db_begin_transaction() == PLATFORM_ERROR_NONE) {}
    ~CtTransaction() {
        if (mBegun) (void)contacts_db_end_transaction(/*commit=*/false);
    }
    CtTransaction(const CtTransaction&) = delete;
    CtTransaction& operator=(const CtTransaction&) = delete;

    [[nodiscard]] bool begun() const { return mBegun; }
    [[nodiscard]] bool commit() {
        mBegun = false;
        return contacts_db_end_transaction(/*commit=*/true) == PLATFORM_ERROR_NONE;
    }

private:
    bool mBegun;
};
