// The test seam behind FailNextMoves, shared by both hosts' MoveDirectory.
// Nothing here is visible above the platform layer.
#ifndef HF_PLATFORM_MOVE_SEAM_H_
#define HF_PLATFORM_MOVE_SEAM_H_

#include "platform/platform.h"

namespace platform {

// True, with the outcome to answer, when a refusal set by FailNextMoves is
// pending; it is then used up.
bool TakeFailedMove(MoveOutcome* outcome);

}  // namespace platform

#endif  // HF_PLATFORM_MOVE_SEAM_H_
