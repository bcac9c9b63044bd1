#ifndef TAMBER_CRYPTO_LRUCACHE_H
#define TAMBER_CRYPTO_LRUCACHE_H

#include <cstddef>
#include <list>
#include <mutex>
#include <string>
#include <string_view>
#include <unordered_map>
#include <utility>

namespace Tamber {
namespace Crypto {

// A bounded, thread-safe map from byte strings to values that drops the least recently used
// entry when full. Values are copied out under the lock, so they should be cheap to copy
// (counted references, small records).
template <class Value>
class LruCache {
 public:
  explicit LruCache(size_t capacity) : _capacity(capacity) {}
  LruCache(const LruCache&) = delete;
  LruCache& operator=(const LruCache&) = delete;

  // Copies the value of `key` into `value` and marks it as just used; false when absent.
  bool Find(std::string_view key, Value& value) {
    std::lock_guard<std::mutex> lock(_mutex);
    auto found = _index.find(key);
    if (found == _index.end()) return false;
    _entries.splice(_entries.begin(), _entries, found->second);
    value = found->second->second;
    return true;
  }

  // Stores `value` under `key` (replacing an older value), evicting the oldest entry when full.
  void Insert(std::string key, Value value) {
    std::lock_guard<std::mutex> lock(_mutex);
    auto found = _index.find(key);
    if (found != _index.end()) {
      found->second->second = std::move(value);
      _entries.splice(_entries.begin(), _entries, found->second);
      return;
    }
    if (_capacity == 0) return;
    if (_entries.size() == _capacity) {
      _index.erase(_entries.back().first);
      _entries.pop_back();
    }
    _entries.emplace_front(std::move(key), std::move(value));
    // The index views the key inside the list node, which never moves.
    _index.emplace(_entries.front().first, _entries.begin());
  }

  size_t Size() const {
    std::lock_guard<std::mutex> lock(_mutex);
    return _entries.size();
  }

 private:
  using Entries = std::list<std::pair<std::string, Value>>;

  const size_t _capacity;
  mutable std::mutex _mutex;
  Entries _entries;  // most recently used first
  std::unordered_map<std::string_view, typename Entries::iterator> _index;
};

}  // namespace Crypto
}  // namespace Tamber

#endif
