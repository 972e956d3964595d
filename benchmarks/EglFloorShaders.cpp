#include "EglFloorShaders.h"

#include "all/gpu/TestShaders.h"

const int floor_vertex_shader_count = pmutil::kTestVertexShaderCount;
const char* const* const floor_vertex_shader = pmutil::kTestVertexShader;
const int floor_fragment_shader_count = pmutil::kTestFragmentShaderCount;
const char* const* const floor_fragment_shader = pmutil::kTestFragmentShader;
