#include "playback/AudioSystem.h"

#include <SDL.h>

#include <mutex>

#include "playback/AudioProducer.h"

namespace glimmet {

namespace {

std::mutex gMutex;
int gUsers = 0;  // guarded by gMutex

void NameTheStream()
{
    SDL_SetHint(SDL_HINT_APP_NAME, AudioProducer::kNodeName);
    SDL_SetHint(SDL_HINT_AUDIO_DEVICE_APP_NAME, AudioProducer::kNodeName);
    SDL_SetHint(SDL_HINT_AUDIO_DEVICE_STREAM_NAME, AudioProducer::kOutputName);
}

}  // namespace

bool AudioSystem::Acquire()
{
    std::lock_guard guard(gMutex);
    NameTheStream();
    if (SDL_InitSubSystem(SDL_INIT_AUDIO) != 0)
        return false;
    ++gUsers;
    return true;
}

void AudioSystem::Release()
{
    std::lock_guard guard(gMutex);
    if (gUsers == 0)
        return;
    SDL_QuitSubSystem(SDL_INIT_AUDIO);
    if (--gUsers == 0)
        SDL_ResetHint(SDL_HINT_AUDIODRIVER);  // a later window tries the real device again
}

bool AudioSystem::SwitchDriver(const char* driver, bool holding, bool* stillHolding)
{
    std::lock_guard guard(gMutex);
    *stillHolding = holding;
    if (gUsers > (holding ? 1 : 0))
        return false;
    if (holding) {
        SDL_QuitSubSystem(SDL_INIT_AUDIO);
        gUsers = 0;
        *stillHolding = false;
    }
    NameTheStream();
    SDL_SetHintWithPriority(SDL_HINT_AUDIODRIVER, driver, SDL_HINT_OVERRIDE);
    if (SDL_InitSubSystem(SDL_INIT_AUDIO) != 0) {
        SDL_ResetHint(SDL_HINT_AUDIODRIVER);
        return false;
    }
    gUsers = 1;
    *stillHolding = true;
    return true;
}

const char* AudioSystem::CurrentDriver()
{
    std::lock_guard guard(gMutex);
    return gUsers > 0 ? SDL_GetCurrentAudioDriver() : nullptr;
}

int AudioSystem::Users()
{
    std::lock_guard guard(gMutex);
    return gUsers;
}

}  // namespace glimmet
