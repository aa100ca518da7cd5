// Memory that runs out.
#pragma once

// While it lives, `granted` more non-throwing allocations of objects succeed and all later ones fail.
class FailingNew {
public:
    explicit FailingNew(int granted);
    FailingNew(const FailingNew&) = delete;
    FailingNew& operator=(const FailingNew&) = delete;
    ~FailingNew();
};

// While it lives, every calloc of the code under test fails.
class FailingCalloc {
public:
    FailingCalloc();
    FailingCalloc(const FailingCalloc&) = delete;
    FailingCalloc& operator=(const FailingCalloc&) = delete;
    ~FailingCalloc();
};
