// The process-wide error state and its codes.
#pragma once

namespace tessaly {

/// 1: no error; negative: the last failure, sticky, silences every block entry of the process.
/// Written by engine construction, the WAV reader, the spectral primitives and the handler;
/// read by the block entry, `comProcessing` and the exported error query. Plain, not guarded.
extern constinit int essError;

constexpr int essErrorNone = 1;
constexpr int essErrorBlockSize = -101;        ///< block size below 2 or not a power of two
constexpr int essErrorSampleRate = -102;       ///< sample rate not 44100, 48000 or 24000 Hz
constexpr int essErrorDatabaseMissing = -103;  ///< packed HRIR file missing
constexpr int essErrorHrirMissing = -104;      ///< no HRIR for a direction, search exhausted
constexpr int essErrorTailUnreadable = -105;   ///< packed reverb file cannot be opened
constexpr int essErrorWavChannels = -107;      ///< channel count differs from the one wanted
constexpr int essErrorWavTooShort = -108;      ///< fewer samples than wanted
constexpr int essErrorWavBitDepth = -109;      ///< neither 32 nor 16 bits per sample
constexpr int essErrorWavUnreadable = -110;    ///< file cannot be opened
constexpr int essErrorTransformPlan = -201;    ///< no transform plan
constexpr int essErrorSpectrumMemory = -202;   ///< no memory for a spectrum

}  // namespace tessaly
