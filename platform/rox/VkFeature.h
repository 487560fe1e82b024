#pragma once

/// The number of a feature of the platform. Any number may be asked for; those that have a meaning here have
/// a name.
enum VkFeature : unsigned {
    VK_FEATURE_LAST_SCHEMA_VERSION = 207,  ///< requests state the last schema version, not the default one
    VK_FEATURE_TYPED_JSON = 548,  ///< bodies go between JSON text and objects without a dictionary in between
};
