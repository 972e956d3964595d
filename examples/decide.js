// SPDX-FileCopyrightText: 2026 the assay authors
// SPDX-License-Identifier: MIT

// Decides whether an application uses OpenGL, by libassay-host and koffi (npm install koffi).
//
// usage: node decide.js [PROGRAM [argument...]]    PROGRAM replaces the assay beside the library
//
// ASSAY_HOST_LIBRARY: the path of the library, if the system doesn't find it by its name.
"use strict";

const koffi = require("koffi");

const name = process.platform === "win32" ? "assay-host.dll" : "libassay-host.so.0";
const library = koffi.load(process.env.ASSAY_HOST_LIBRARY || name);
const declare = (text) => library.func(text);

const optionsNew = declare("void *assay_host_options_new()");
const optionsFree = declare("void assay_host_options_free(void *options)");
const setProgram = declare("int assay_host_options_set_program(void *options, const char *path)");
const addArgument = declare("int assay_host_options_add_argument(void *options, const char *text)");
const setTimeout_ = declare("int assay_host_options_set_timeout(void *options, double seconds)");
const run = declare("int assay_host_run(void *options, void *stop, _Out_ void **result)");
const resultFree = declare("void assay_host_result_free(void *result)");
const usable = declare("int assay_host_result_usable(void *result, int which)");
const usableText = declare("const char *assay_host_result_usable_text(void *result, int which)");
const usabilityName = declare("const char *assay_host_usability_name(int usability)");
const resultDocument = declare("const char *assay_host_result_document(void *result, void *size)");
const errorText = declare("const char *assay_host_error_text(int error)");

const OPENGL = 0;

function check(error) {
  if (error !== 0) throw new Error(errorText(error));
}

const options = optionsNew();
check(setTimeout_(options, 20));
process.argv.slice(2).forEach((word, index) => {
  check(index === 0 ? setProgram(options, word) : addArgument(options, word));
});

// On a thread of koffi's, so that the event loop goes on.
const result = [null];
run.async(options, null, result, (failure, error) => {
  if (failure) throw failure;
  optionsFree(options);
  check(error);
  console.log(`OpenGL ${usabilityName(usable(result[0], OPENGL))}: ${usableText(result[0], OPENGL)}`);
  const report = JSON.parse(resultDocument(result[0], null));
  console.log(report.outcome.verdict);
  resultFree(result[0]);
});
