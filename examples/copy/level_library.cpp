// The product library of the sample copy: returns its level.
#include <cstdint>
#include <cstring>

struct sqleLevelInfo {
    char level[256];
};

#if defined(__GNUC__) && !defined(__MINGW32__)
#define KZ7_SAMPLE_EXPORT __attribute__((visibility("default")))
#else
#define KZ7_SAMPLE_EXPORT __declspec(dllexport)
#endif

extern "C" KZ7_SAMPLE_EXPORT int sqleGetLevelInfo(std::uint32_t version, sqleLevelInfo* info) {
    if (version != 0x09010000 || info == nullptr) {
        return -1;
    }
    std::strcpy(info->level, "KZ7 v9.1.0.0");
    return 0;
}
