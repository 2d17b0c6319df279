// A composer with the engine components that it reads.
#pragma once

#include <cstddef>
#include <cstdint>

#include "engine/fir_composer.h"
#include "engine/hrir_table_fixture.h"
#include "support/log_capture.h"

namespace tessaly::test {

/// One engine's components around a composer.
class FirComposerTest : public HrirTableTest {
protected:
    FirComposerTest() {
        const LogCapture quiet;
        frontEnd.prepareFilters(sampleRate);
        switches.qvTrackDirection = true;
        switches.hrirLength = 128;
        switches.limitPhi = 180;
        switches.limitTheta = 90;
        law.directGain = 0.7f;
        law.earlyDistanceGain = 0.9f;
        law.reverbDistanceGain = 0.8f;
        mix.directGain = 0.6f;
        mix.earlyGain = 0.5f;
        mix.reverbGain = 0.4f;
        direction.indexPhi = 40;
        direction.indexTheta = 20;
        setSizes(1024, 256);
    }

    void setSizes(int firSize, int blocklenght) {
        sizes.blocklenght = blocklenght;
        sizes.FIR_size = firSize;
        sizes.firBufferSize = firSize + blocklenght;
    }

    void setRate(int rate, int hrirLength) {
        const LogCapture quiet;
        sampleRate = rate;
        frontEnd.prepareFilters(rate);
        switches.hrirLength = static_cast<std::int16_t>(hrirLength);
    }

    CompositionInputs inputs() {
        return {switches,     sizes,    sampleRate,   direction,    law,
                mix,          controls, staticFilter, filterChange, forceUpdate,
                blockCounter, frontEnd, reflections,  tail};
    }

    /// Composes into two buffers of exactly `firBufferSize` floats that held something before.
    Ears compose() {
        Ears ears(sizes.firBufferSize, 3.0f);
        CompositionInputs in = inputs();
        composer.composeFIR(ears.left.get(), ears.right.get(), in);
        return ears;
    }

    /// Adds a record of noise from its own direction. @return the record
    ReflectionRecord& addRecord(int delay, int filterClass) {
        const auto number = static_cast<std::size_t>(reflections.flexReflectionCount++);
        ReflectionRecord& record = reflections.records[number];
        record.indexPhi = static_cast<std::int16_t>(number);
        record.indexTheta = 10;
        store(record.indexPhi, record.indexTheta);
        record.delaySamples = static_cast<std::int16_t>(delay);
        record.filterClass = static_cast<std::int16_t>(filterClass);
        record.gain = 0.05f + 0.01f * static_cast<float>(number);
        record.distanceGain = 0.8f;
        switches.qvFlexReflections = true;
        return record;
    }

    int sampleRate = 44100;
    EffectiveSettings switches;
    FirSizes sizes;
    SourceDirection direction;
    DistanceLaw law;
    MixParameters mix;
    LiveControls controls;
    HrirSlot staticFilter = nullptr;
    bool filterChange = true;
    bool forceUpdate = false;
    unsigned int blockCounter = 1;
    InputFrontEnd frontEnd;
    Reflections reflections;
    ReverbTail tail;
    FirComposer composer;
    FirInterpolation interpolation;
};

}  // namespace tessaly::test
