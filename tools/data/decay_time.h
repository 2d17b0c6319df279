// Reverberation time over frequency: the surfaces of a kind of room, and the air in it.
#pragma once

namespace tessaly::data {

/// Kinds of rooms: how their surfaces' absorption changes with frequency.
enum class RoomClass {
    stone,
    hard,
    wood,
    hall,
    furnished,
    treated,
    tile,
    car,
    plate,
    ambience,
    outdoor,
    metal
};

/// Decay of a room of a class.
class DecayTime {
public:
    /// @param midSeconds  geometric mean of the times at 500 and 1000 Hz, above 0
    DecayTime(RoomClass roomClass, double midSeconds);

    /// Seconds to fall by 60 dB.
    /// @param hertz  above 0
    double at(double hertz) const noexcept;
    double mid() const noexcept { return mid_; }

private:
    double unscaled(double hertz) const noexcept;

    RoomClass roomClass_;
    double mid_;
    double base_;   ///< surfaces alone at 1000 Hz
    double scale_;  ///< puts the mean of 500 and 1000 Hz where it is wanted
};

}  // namespace tessaly::data
