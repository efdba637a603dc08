#include "Platform/UserActivity.h"

namespace platform {

namespace {

std::shared_ptr<const UserActivity>& currentActivity() {
    static std::shared_ptr<const UserActivity> activity;
    return activity;
}

}  // namespace

std::shared_ptr<const UserActivity> UserActivity::current() {
    return currentActivity();
}

void UserActivity::makeCurrent(std::shared_ptr<const UserActivity> activity) {
    currentActivity() = std::move(activity);
}

}  // namespace platform
