#pragma once

/// Names what a descriptor's listener listens to: RoxListenerInterface<RoxFdEvent>.
struct RoxFdEvent {};
