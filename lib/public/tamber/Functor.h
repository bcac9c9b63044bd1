#ifndef TAMBER_FUNCTOR_H
#define TAMBER_FUNCTOR_H

#include <functional>

namespace Tamber {

// The layer's deferred call: a copyable function object that takes no argument and returns R.
// Anything callable without arguments converts to it (a lambda, a boost::bind or std::bind
// result, a boost::function). Work items of the thread pool are Functor<void>.
template <class R>
using Functor = std::function<R()>;

}  // namespace Tamber

#endif
