// The shader program with which a device's compiler is tried: one pass of a compositor, a sampler
// of nine taps and a blend over a background. Its texts are a fixed part of the trial, unused
// functions and variables included. OpenGL joins the entries with nothing between them.
#pragma once

namespace pmutil {

inline constexpr int kTestVertexShaderCount = 13;
inline constexpr int kTestFragmentShaderCount = 76;

extern const char* const kTestVertexShader[kTestVertexShaderCount];
extern const char* const kTestFragmentShader[kTestFragmentShaderCount];

} // namespace pmutil
