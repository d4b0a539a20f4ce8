// The sound client: those of its functions that can fail.
#include <cstddef>

#include "Hook.h"

TORTURE_HOOK(PULSE, 0, nullptr, void*, pa_mainloop_new, (), ());
TORTURE_HOOK(PULSE, 0, -1, int, pa_mainloop_iterate, (void* loop, int block, int* result),
             (loop, block, result));
TORTURE_HOOK(PULSE, 0, -1, int, pa_proplist_sets, (void* list, const char* key, const char* value),
             (list, key, value));
TORTURE_HOOK(PULSE, 0, nullptr, void*, pa_context_new, (void* api, const char* name), (api, name));
TORTURE_HOOK(PULSE, 0, -1, int, pa_context_connect,
             (void* context, const char* server, int flags, const void* spawn),
             (context, server, flags, spawn));
TORTURE_HOOK(PULSE, 0, nullptr, void*, pa_stream_new_with_proplist,
             (void* context, const char* name, const void* format, const void* map, void* list),
             (context, name, format, map, list));
TORTURE_HOOK(PULSE, 0, -1, int, pa_stream_connect_record,
             (void* stream, const char* device, const void* sizes, int flags),
             (stream, device, sizes, flags));
TORTURE_HOOK(PULSE, 0, -1, int, pa_stream_peek,
             (void* stream, const void** bytes, std::size_t* size), (stream, bytes, size));
TORTURE_HOOK(PULSE, 0, -1, int, pa_stream_drop, (void* stream), (stream));
TORTURE_HOOK(PULSE, 0, static_cast<std::size_t>(-1), std::size_t, pa_stream_readable_size,
             (void* stream), (stream));
TORTURE_HOOK(PULSE, 0, -1, int, pa_stream_disconnect, (void* stream), (stream));
