// The message part of service/platform/platform.h, on the catalogue of fake_messages.h.

#include "tests/platform/fake_messages.h"

#include <cstring>

#include "service/platform/platform.h"

using qtb::test::fake_messages;

unsigned long platform_message_locale() { return fake_messages.locale; }

void *platform_open_catalog(const char *path) {
  ++fake_messages.opened;
  fake_messages.path = path;
  return fake_messages.present ? &fake_messages : nullptr;
}

bool platform_catalog_message(void *catalog, std::int32_t number, char *buffer, std::size_t size) {
  if (catalog != &fake_messages) return false;
  const auto found = fake_messages.texts.find(number);
  if (found == fake_messages.texts.end() || found->second.size() >= size) return false;
  std::memcpy(buffer, found->second.c_str(), found->second.size() + 1);
  return true;
}
