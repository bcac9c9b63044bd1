#ifndef TAMBER_EXPORT_H
#define TAMBER_EXPORT_H

// The core layer is built with hidden visibility; what it offers to the library is marked here.
#define TAMBER_API __attribute__((visibility("default")))

#endif
