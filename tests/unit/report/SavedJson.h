// Saves the JSON of the tests in the folder ASSAY_JSON, if that is set, for another test to
// validate.
#pragma once

#include <cstdlib>
#include <fstream>
#include <sstream>
#include <string>

#include <gtest/gtest.h>
#include <nlohmann/json.hpp>

#include "report/JsonDocument.h"
#include "report/JsonReader.h"

namespace assay_host {

using Json = nlohmann::ordered_json;

inline void SaveText(const std::string& text, const char* ending)
{
    const char* const folder = std::getenv("ASSAY_JSON");
    if (!folder)
        return;
    static int count = 0;
    const auto* const test = testing::UnitTest::GetInstance()->current_test_info();
    const std::string path = std::string(folder) + "/" + test->test_suite_name() + "." +
                             test->name() + "." + std::to_string(count++) + ending;
    std::ofstream file(path, std::ios::binary);
    file << text;
    file.close();
    EXPECT_TRUE(file) << path;
}

// The product's functions on streams, with whole documents.
inline std::string GetDocumentText(const Report& report, const RunOutcome& outcome)
{
    std::ostringstream out;
    WriteFirstDocument(out, report, outcome);
    return out.str();
}

inline Json MakeDocument(const Report& report, const RunOutcome& outcome)
{
    return Json::parse(GetDocumentText(report, outcome));
}

inline Report ReadDocument(const Json& document)
{
    std::istringstream in(document.dump());
    return ReadDocument(in);
}

inline Report ReadEvents(const std::string& text)
{
    std::istringstream in(text);
    return ReadEvents(in);
}

// Saves the JSON and returns it as a reader parses it.
inline Json SaveDocument(const Json& document)
{
    const std::string text = document.dump(2);
    SaveText(text, ".json");
    return Json::parse(text);
}

inline Json SaveEvent(const std::string& event)
{
    SaveText(event, ".jsonl");
    return Json::parse(event);
}

} // namespace assay_host
