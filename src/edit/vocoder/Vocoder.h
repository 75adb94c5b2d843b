#pragma once

// The phase vocoder's routines, as one include.
#include "edit/vocoder/Convert.h"
#include "edit/vocoder/Fft.h"
#include "edit/vocoder/OscillatorBank.h"
#include "edit/vocoder/Space.h"
#include "edit/vocoder/VocoderState.h"
#include "edit/vocoder/Windowing.h"
