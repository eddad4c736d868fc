#include "platform/move_seam.h"

namespace platform {
namespace {

// The tool moves from its one thread; so do the tests.
struct Refusals {
  int skip = 0;
  int count = 0;
  MoveOutcome outcome = MoveOutcome::kFailed;
};

Refusals& Pending() {
  static Refusals refusals;
  return refusals;
}

}  // namespace

int FailNextMoves(int count, MoveOutcome outcome, int skip) {
  const int unused = Pending().count;
  Pending() = Refusals{skip > 0 ? skip : 0, count > 0 ? count : 0, outcome};
  return unused;
}

bool TakeFailedMove(MoveOutcome* outcome) {
  if (Pending().count == 0) return false;
  if (Pending().skip > 0) {
    --Pending().skip;
    return false;
  }
  --Pending().count;
  *outcome = Pending().outcome;
  return true;
}

}  // namespace platform
