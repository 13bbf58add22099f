// CalTransaction: a transaction of the calling thread over the calendar service, undone unless commit() was called.
#pragma once

#include "platform/calendar.h"

class CalTransaction {
public:
    CalTransaction() : mBegun(calendar_db_begin_transaction() == PLATFORM_ERROR_NONE) {}
    ~CalTransaction() {
        if (mBegun) (void)calendar_db_end_transaction(/*commit=*/false);
    }
    CalTransaction(const CalTransaction&) = delete;
    CalTransaction& operator=(const CalTransaction&) = delete;

    [[nodiscard]] bool begun() const { return mBegun; }
    [[nodiscard]] bool commit() {
        mBegun = false;
        return calendar_db_end_transaction(/*commit=*/true) == PLATFORM_ERROR_NONE;
    }

private:
    bool mBegun;
};
