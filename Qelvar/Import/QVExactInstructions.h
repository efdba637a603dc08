#pragma once

#include <map>
#include <optional>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "Qelvar/Import/QVRecordElement.h"
#include "Vessa/VSUnit.h"

// The processing instructions of a records document that say exactly what attributes cannot; their grammar
// is in docs/exact-instructions.md. An instruction refines what an attribute says and never contradicts it:
// where both differ somebody has changed the attribute, and it counts. Used by one thread.

/// Raised when an instruction gets another meaning, not when one is added. Documents of a greater version
/// are read without their instructions.
inline constexpr int64_t kQVExactVersion = 1;
inline constexpr const char* kQVExactTarget = "qelvar-exact";

// Names of instructions that are no attributes. In documents; never change.
inline constexpr std::string_view kQVExactVersionName = "version", kQVExactTimeZone = "timeZone",
                                  kQVExactSource = "source", kQVExactWorkouts = "workouts",
                                  kQVExactNumber = "number", kQVExactMicroseconds = "microseconds",
                                  kQVExactMedicalID = "medicalID", kQVExactPicture = "picture";
inline constexpr std::string_view kQVExactUnknownTimeZone = "unknown";
/// The dates of an element in the order of `microseconds`.
enum QVExactDate { QVExactStart, QVExactEnd, QVExactCreation, QVExactDateCount };

/// The identifiers of sources that are not those of their names alone. Both sides of a document forget all
/// of them at the same moment, so that it is said again what the other forgot.
class QVExactSources {
 public:
    /// None: that of the name.
    const std::optional<std::string>& identifierOf(std::string_view name) const;
    void set(const std::string& name, const std::optional<std::string>& identifier);

 private:
    static constexpr size_t kMostNames = 4096;
    std::map<std::string, std::optional<std::string>, std::less<>> identifiers_;
};

/// What holds for the element that follows.
struct QVExactFacts {
    std::map<QVAttributeName, VSValue> attributes;
    std::vector<int> microseconds;  // 0 to 999999; those that are missing are 0
    int64_t number = 0;
    std::string medicalID;
    bool isEmpty() const {
        return attributes.empty() && microseconds.empty() && number == 0 && medicalID.empty();
    }
    int microsecondsOf(size_t date) const { return date < microseconds.size() ? microseconds[date] : 0; }
};

/// What the instructions of one document have said so far.
class QVExactInstructions {
 public:
    /// One instruction. What is not of the grammar says nothing.
    void read(std::string_view content);
    /// For the element that has begun; the next one has its own.
    QVExactFacts takeFacts() { return std::exchange(next_, {}); }
    void forgetFacts() {
        if (!next_.isEmpty()) next_ = {};
    }

    // What holds until it is said otherwise:
    /// The offset with which a record was noted whose dates say `offset`; none: unknown.
    std::optional<int> timeZoneOffset(int offset) const { return timeZone_ ? *timeZone_ : offset; }
    const QVExactSources& sources() const { return sources_; }
    const std::vector<int64_t>& workouts() const { return workouts_; }

 private:
    void readTimeZone(const VSValue& value);
    void readSource(const VSValue& value);
    void readWorkouts(const VSValue& value);
    void readMicroseconds(const VSValue& value);
    void readAttribute(std::string_view name, VSValue value);

    bool isForeign_ = false;  // of a later version
    std::optional<std::optional<int>> timeZone_;
    QVExactSources sources_;
    std::vector<int64_t> workouts_;
    QVExactFacts next_;
};

// Whether what is said exactly is what the attribute says, but for what an attribute cannot say.
bool QVExactAgrees(const std::string& exact, std::string_view attribute);
/// `exact` in the canonical unit of the type, `attribute` in `unit` and written with so many digits.
bool QVExactAgrees(double exact, const VSUnit& canonical, double attribute, const VSUnit& unit, int digits);
