#pragma once

#include <cstddef>

namespace examples {

/// A colour of the sRGB space, each part from 0 to 1.
struct Colour {
  double red;
  double green;
  double blue;
};

/// A colour ramp takes a position from 0 to 1.
using Ramp = Colour (*)(double position);

/// Black to white.
Colour GreyRamp(double position);

/// From pale yellow over red to dark violet, evenly darker: for amounts.
Colour HeatRamp(double position);

/// From dark brown over light grey to dark teal, equally dark on both sides: for decrease and increase. The
/// sides differ in blue, which the common forms of colour blindness leave, and the middle is no white that
/// could be taken for paper.
Colour ChangeRamp(double position);

/// From blue over pale sand to dark green: for indices of vegetation around 0, which water is below.
Colour PlantRamp(double position);

/// From pale sand to dark green, evenly darker: for amounts of vegetation.
Colour GreenRamp(double position);

/// The colour of one of `count` classes in their order: from blue over green and yellow to red, lighter and
/// darker by turns, so that neighbours differ.
Colour ClassColour(std::size_t place, std::size_t count);

/// A closed circle of hues, lightest at the north-west, as maps light their relief: for directions, 0 and 1
/// being north.
Colour CompassRamp(double position);

}  // namespace examples
