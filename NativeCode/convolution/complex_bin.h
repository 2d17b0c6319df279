// One bin of a spectrum.
#pragma once

namespace tessaly {

/// Single precision, real part first. A spectrum of a real block of 2B samples is B+1 bins in
/// natural order; bins 0 (DC) and B (Nyquist) keep their imaginary part in the storage.
struct ComplexBin {
    float re;
    float im;
};
static_assert(sizeof(ComplexBin) == 2 * sizeof(float));

}  // namespace tessaly
