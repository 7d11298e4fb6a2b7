// The reference host in one piece: an allocator, a tracer and a locator that hands out both.
#pragma once

#include "host/allocator.h"
#include "host/service_locator.h"
#include "host/tracer.h"

namespace pelmix::host {

struct Host {
  uvo::Ptr<Allocator> allocator;
  uvo::Ptr<Tracer> tracer;
  uvo::Ptr<ServiceLocator> locator;

  explicit Host(int traceLevel = 1000)
      : allocator(Allocator::Create()),
        tracer(Tracer::Create(traceLevel)),
        locator(ServiceLocator::Create(allocator.Get(), tracer.Get())) {}
};

}  // namespace pelmix::host
