#include "session/Apartment.h"

#include "platform/Internet.h"
#include "platform/StringResources.h"

namespace tarnwick {

FtpState::FtpState() = default;
FtpState::~FtpState() = default;

Apartment::Apartment(const Platform& systemPlatform) : platform(systemPlatform) {}
Apartment::~Apartment() = default;

}  // namespace tarnwick
