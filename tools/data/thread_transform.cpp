// One transform a length and thread.
#include "data/thread_transform.h"

#include <map>
#include <memory>

namespace tessaly::data {

RealTransform& threadTransform(std::size_t length) {
    thread_local std::map<std::size_t, std::unique_ptr<RealTransform>> transforms;
    std::unique_ptr<RealTransform>& transform = transforms[length];
    if (transform == nullptr) {
        transform = std::make_unique<RealTransform>(length);
    }
    return *transform;
}

}  // namespace tessaly::data
