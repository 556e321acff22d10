// The special members of a proxy class: exactly the base's.
#pragma once

#define VLXKDM_PROXY_DEFINITIONS(Class)                                  \
  Class::Class() = default;                                              \
  Class::Class(const Class& other) = default;                            \
  Class& Class::operator=(const Class& other) = default;                 \
  Class::~Class() = default;
