// The shader program of the compile test: one pass of a compositor, a sampler with nine taps and a
// blend over a background. Don't change the texts, not even the unused functions and variables, so
// that results stay comparable. OpenGL concatenates the entries without separators.
#pragma once

namespace pmutil {

inline constexpr int kTestVertexShaderCount = 13;
inline constexpr int kTestFragmentShaderCount = 76;

extern const char* const kTestVertexShader[kTestVertexShaderCount];
extern const char* const kTestFragmentShader[kTestFragmentShaderCount];

} // namespace pmutil
