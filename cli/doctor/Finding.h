// Finding.h: what the doctor says about one thing that it has looked at.
#pragma once

#include <string>
#include <vector>

enum class Health {
    kGood,
    kNotice,   // works, and its owner may want to know
    kProblem,  // keeps something from working, or is unsafe
};

struct Finding {
    std::string check;  // the area: "folders", "keys", "servers" ...
    Health health = Health::kGood;
    std::string text;
    std::string advice;  // how to mend it; empty when there is nothing to mend
};

// Collects the findings of one area.
class Findings {
public:
    explicit Findings(std::vector<Finding>* all, std::string check) : mAll(*all), mCheck(std::move(check)) {}

    void good(std::string text) { add(Health::kGood, std::move(text), {}); }
    void notice(std::string text, std::string advice) {
        add(Health::kNotice, std::move(text), std::move(advice));
    }
    void problem(std::string text, std::string advice) {
        mHasProblem = true;
        add(Health::kProblem, std::move(text), std::move(advice));
    }
    [[nodiscard]] bool hasProblem() const { return mHasProblem; }

private:
    void add(Health health, std::string text, std::string advice) {
        mAll.push_back({mCheck, health, std::move(text), std::move(advice)});
    }

    std::vector<Finding>& mAll;
    const std::string mCheck;
    bool mHasProblem = false;
};
