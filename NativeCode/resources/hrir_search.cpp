// The substitute for a missing HRIR file: a neighbour that is mapped already.
#include "resources/hrir_search.h"

#include "base/ess_error.h"
#include "base/log.h"

namespace tessaly {

namespace {

constexpr int maxThetaTurns = 200;

enum class ThetaWalk { found, gap, exhausted };

/// What is mapped at a place; nothing is, off the grid.
HrirSlot mappedAt(int indexPhi, int indexTheta) {
    const HrirSlot* cell = filterTableCell(indexPhi, indexTheta);
    return cell != nullptr ? *cell : nullptr;
}

void take(HrirSlot& cell, int indexPhi, int indexTheta) {
    cell = mappedAt(indexPhi, indexTheta);
    logOutput("next file passed = ", cell != nullptr);
}

/// Steps along the meridian: upwards one by one, at the upper end one down.
ThetaWalk walkTheta(HrirSlot& cell, const HrirSearch& search) {
    const int i = search.indexPhi;
    const int t = search.indexTheta;
    int countFail = 0;
    int step = 1;
    while (countFail <= maxThetaTurns) {
        ++countFail;
        logOutput("chose next file! + theta! (countFail = ", countFail);
        take(cell, i, t + step);
        if (t + step > search.lastTheta) {
            step = 1;
            logOutput("chose next file! - theta!");
            take(cell, i, t - 1);
            if (t - 1 < 0) {
                return ThetaWalk::exhausted;
            }
        }
        if (cell != nullptr) {
            logOutput("found it! :-) ", i, '\t', t + step);
            return ThetaWalk::found;
        }
        ++step;
        if (mappedAt(i, t - step) != nullptr) {
            return ThetaWalk::gap;
        }
    }
    return ThetaWalk::exhausted;
}

bool fail(HrirSlot& cell, const HrirSearch& search) {
    cell = nullptr;
    logBoth("Tessaly_e ERROR: no corresponding HRIR-found for phi ", search.phi, " and theta ",
            search.theta, "found!");
    essError = essErrorHrirMissing;
    return false;
}

}  // namespace

bool searchMappedHrir(HrirSlot& cell, const HrirSearch& search) {
    const int i = search.indexPhi;
    const int t = search.indexTheta;
    logOutput("File not found searching for alternatives....");
    bool leftEdgePassed = false;
    int step = 1;
    do {
        logOutput("chose next file! - phi!");
        take(cell, i - step, t);
        if (i - step < 0) {
            // A second arrival at the edge finds all as the first one did and would go on so
            // for ever.
            if (leftEdgePassed) {
                return fail(cell, search);
            }
            leftEdgePassed = true;
            step = 1;
            logOutput("chose next file! + phi!");
            take(cell, i + 1, t);
            if (i + 1 > search.lastPhi) {
                switch (walkTheta(cell, search)) {
                    case ThetaWalk::found:
                        return true;
                    case ThetaWalk::exhausted:
                        return fail(cell, search);
                    case ThetaWalk::gap:
                        break;
                }
            }
        }
        if (cell != nullptr) {
            // The step is told as if it went down, also for the neighbour above.
            logOutput("found it! :-) ", i - step, '\t', t);
            return true;
        }
        ++step;
        // A filled cell behind an empty one ends the search with nothing taken.
    } while (mappedAt(i - step, t) == nullptr);
    return true;
}

}  // namespace tessaly
