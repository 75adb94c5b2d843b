#include <cstdio>

// The document window is not built yet: this program only says so. The sound
// engine it will drive is in place and exercised by the test suite.
int main(int argc, char** argv)
{
    std::printf("Glimmet %s: the editor window is not available in this build yet.\n", "0.1");
    std::printf("This build contains the sound engine (channels, mixing) and its tests.\n");
    for (int i = 1; i < argc; ++i)
        std::printf("Not opened (no editor window yet): %s\n", argv[i]);
    return 0;
}
