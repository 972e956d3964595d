// The forms of an advice: for people, for shells, and as a JSON document. Any thread may call.
#pragma once

#include <cstdint>
#include <optional>
#include <string>

#include "memory/Adviser.h"

namespace assay_host {

// Incremented when the document changes in a way that breaks existing readers. host/schema has the
// schema.
constexpr int kAdviceSchemaVersion = 1;

// Returns the stable identifier of the reason: "chosen", or that of what was learnt.
std::string GetAdviceReason(const InterfaceAdvice& part);

// Returns its sentence, safe to write to a terminal.
std::string GetAdviceText(const InterfaceAdvice& part, DeviceKind kind);

// Returns the age of the attempt or of the choice in seconds, at least 0; nothing without either.
std::optional<std::int64_t> GetAdviceAge(const Advice& advice, const InterfaceAdvice& part);

// Returns the exit status for a caller that needs what is requested: that of the needed
// interface's usability, of both the worse one's; that of an interrupted run if the call was asked
// to stop.
int GetAdviceStatus(const AdviceRequest& request, const Advice& advice);

// What an answer is from: "attempt" of this call, "memory", "choice" of the user, or "none".
const char* GetSourceName(const Advice& advice, DeviceKind kind);

// Returns a sentence on what the caller or the user can do to change the answer.
std::string GetChangeText(const Advice& advice, DeviceKind kind);

// Returns the lines for people. All texts are safe to write to a terminal.
std::string MakeAdviceText(const Advice& advice);

// Returns lines that a shell can evaluate: NAME='value'. Bytes that aren't text are escaped as
// ShowBytes() does.
std::string MakeAdviceVariables(const Advice& advice);

// Returns the JSON document with a line end. `status` is the exit status.
std::string MakeAdviceDocument(const Advice& advice, const std::string& hostVersion, int status);

} // namespace assay_host
