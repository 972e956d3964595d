// The program's test shaders, for EglFloor.c.
#pragma once

#ifdef __cplusplus
extern "C" {
#endif

extern const int floor_vertex_shader_count;
extern const char* const* const floor_vertex_shader;
extern const int floor_fragment_shader_count;
extern const char* const* const floor_fragment_shader;

#ifdef __cplusplus
}
#endif
