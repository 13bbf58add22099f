// INotificationListener: who is told that the state of a kind has changed, on the default main context.
#pragma once

#include "common/vantor_pim_sync.h"

class INotificationListener {
public:
    virtual ~INotificationListener() = default;
    virtual void notify() = 0;
    [[nodiscard]] virtual vantor_pim_sync_type_e getType() const = 0;
    [[nodiscard]] virtual bool isSame(vantor_pim_sync_state_changed_cb callback, void* userData) const = 0;
};

// StateChangedListener: calls a client's callback.
class StateChangedListener : public INotificationListener {
public:
    StateChangedListener(vantor_pim_sync_type_e type, vantor_pim_sync_state_changed_cb callback,
                         void* userData)
        : mType(type), mCallback(callback), mUserData(userData) {}

    void notify() override {
        if (mCallback != nullptr) mCallback(mType, mUserData);
    }
    [[nodiscard]] vantor_pim_sync_type_e getType() const override { return mType; }
    [[nodiscard]] bool isSame(vantor_pim_sync_state_changed_cb callback, void* userData) const override {
        return mCallback == callback && mUserData == userData;
    }

private:
    const vantor_pim_sync_type_e mType;
    const vantor_pim_sync_state_changed_cb mCallback;
    void* const mUserData;
};
