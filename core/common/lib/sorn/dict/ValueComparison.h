#pragma once

class RoxMempool;

namespace sorn {

class Dictionary;
class DictValue;

/// The engine of DictValue::Equals: a equals b, a null only null. Without recursion, in time linear in the
/// number of values met, shared ones as often as they are met, and in the texts of the lazy bodies met, which
/// compare by these as a whole.
bool FEqualValues(const DictValue* a, const DictValue* b);

/// The engine of Dict::Equals(const ref<Dict>&), without recursion too. Bodies that must be converted for it
/// are converted in the pool.
bool FEqualStructures(const Dictionary& a, const Dictionary& b, RoxMempool* pool);

}  // namespace sorn
