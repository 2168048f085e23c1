#pragma once

namespace vi {

namespace Orientation {
// 0 is the orientation a scene starts in; any other value is the alternate one.
// The host passes any int, so the type holds any int.
enum OrientationEnum : int {
    Initial = 0,
    Alternate = 1,
};

// The scene's mInitialised has two entries: one for the initial orientation and
// one shared by every other value, so 7, 1 and -1 are one orientation. The
// value itself stays as the host gave it in mOrientation.
inline int initialisedIndex(OrientationEnum orientation) { return orientation == Initial ? 0 : 1; }
}  // namespace Orientation

}  // namespace vi
