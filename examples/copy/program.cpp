// A program of the sample copy: prints its command line and succeeds. Two variables change that: KZ7_SAMPLE_EXIT is the
// exit code, KZ7_SAMPLE_HOOK a command that it runs first, for example to look at the store.
#include <cstdio>
#include <cstdlib>

int main(int argc, char** argv) {
    if (const char* hook = std::getenv("KZ7_SAMPLE_HOOK"); hook != nullptr && std::system(hook) != 0) {
        return 125;
    }
    for (int i = 0; i < argc; ++i) {
        std::printf("%s%s", i == 0 ? "" : " ", argv[i]);
    }
    std::printf("\n");
    const char* code = std::getenv("KZ7_SAMPLE_EXIT");
    return code == nullptr ? 0 : std::atoi(code);
}
