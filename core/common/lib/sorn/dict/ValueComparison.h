#pragma once

class RoxMempool;

namespace sorn {

class Dictionary;
class DictValue;

/// The engine of DictValue::Equals: a equals b, a null only null. Without recursion, in time linear in the
/// smaller of the two.
bool FEqualValues(const DictValue* a, const DictValue* b);

/// The engine of Dict::Equals(const ref<Dict>&), without recursion too. Bodies that must be converted for it
/// are converted in the pool.
bool FEqualStructures(const Dictionary& a, const Dictionary& b, RoxMempool* pool);

}  // namespace sorn
