#pragma once

namespace vi {

namespace Orientation {
// 0 is the orientation a scene starts in; any other value is the alternate one.
enum OrientationEnum {
    Initial = 0,
    Alternate = 1,
};
}  // namespace Orientation

}  // namespace vi
