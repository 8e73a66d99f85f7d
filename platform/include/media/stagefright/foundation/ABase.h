#ifndef A_BASE_H_
#define A_BASE_H_

#define DISALLOW_EVIL_CONSTRUCTORS(name) \
    name(const name&) = delete;          \
    name& operator=(const name&) = delete

#endif
