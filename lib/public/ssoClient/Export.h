#ifndef SSOCLIENT_EXPORT_H
#define SSOCLIENT_EXPORT_H

// The library is built with hidden visibility; its public API is marked here.
#define SSOCLIENT_API __attribute__((visibility("default")))

#endif
