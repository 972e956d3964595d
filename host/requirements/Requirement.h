// A requirement of a machine: "GLMemoryMB>=2048". docs/requirements.md has the grammar. Value
// types; any thread may call.
#pragma once

#include <optional>
#include <string>
#include <variant>

#include "report/KnownKeys.h"
#include "report/LineForm.h"
#include "report/Usable.h"
#include "requirements/Version.h"

namespace assay_host {

enum class Relation { kEqual, kNotEqual, kLess, kLessOrEqual, kGreater, kGreaterOrEqual };

// Which devices have to meet a requirement on a device's key.
enum class Scope { kAny, kAll, kOne };

// What is compared, besides keys.
enum class InterfaceFact {
    kDevices, // how many devices the interface has
    kUsable   // whether the interface can be used
};

struct FactOf {
    InterfaceFact fFact;
    DeviceKind fKind;
};

// The value on the right side, in the type of the left side. The text is for texts and dates.
using Wanted = std::variant<double, Version, std::string, Usability>;

struct Requirement {
    std::string fText; // as it was written
    Scope fScope = Scope::kAny;
    std::optional<DeviceTag> fDevice; // of the scope kOne
    std::variant<const KnownKey*, FactOf> fSubject;
    Relation fRelation = Relation::kEqual;
    Wanted fWanted;
};

// Throws std::runtime_error with the text "REQUIREMENT: REASON", safe to write to a terminal. The
// reason for an unknown key names the most similar one, if there is one.
Requirement ParseRequirement(const std::string& text);

// Returns whether the relation holds between two values of a type with an order.
template <typename T>
bool Holds(Relation relation, const T& left, const T& right)
{
    switch (relation) {
    case Relation::kEqual:
        return left == right;
    case Relation::kNotEqual:
        return !(left == right);
    case Relation::kLess:
        return left < right;
    case Relation::kLessOrEqual:
        return !(right < left);
    case Relation::kGreater:
        return right < left;
    case Relation::kGreaterOrEqual:
        break;
    }
    return !(left < right);
}

} // namespace assay_host
