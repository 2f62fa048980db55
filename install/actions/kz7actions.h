/* The entry points of kz7actions64.dll, for packages that name them as custom actions and for custom-action libraries
 * that load it. Installation handles are those that the installer calls a custom action with; statuses are its numbers
 * and the system's, 0 for success, and this runtime's own between 5000 and 6100. Texts are narrow, in the active code
 * page, and end with a NUL. One thread at a time calls them. */
#ifndef KZ7ACTIONS_H
#define KZ7ACTIONS_H

#include <stdint.h>

#ifdef __cplusplus
extern "C" {
#endif

/* Custom action, immediate: saves what deferred actions will need where iMsiGetProperty() finds it. The property
 * RSP_FILE_PATH, where it is set, names the response file in use. 6045: not in an immediate action. */
uint32_t iSavePropertiesForDeferred(uint32_t installation);

/* Custom action of any kind: deletes what was saved. */
uint32_t iDeleteSavedProperties(uint32_t installation);

/* Reads a property in immediate and deferred actions alike. `size` is the buffer's in bytes, and afterwards the
 * value's: without its NUL where the installer gave it, with it where it was saved. 234: the buffer is too small, and
 * `size` a hint, which may be twice what is needed; 1,024 bytes are enough for what was saved. 5021, 87: an argument is
 * missing, in an immediate and in a deferred action. */
uint32_t iMsiGetProperty(uint32_t installation, const char* name, char* buffer, uint32_t* size);

/* Sets a property; null or an empty text unsets it. */
uint32_t iMsiSetProperty(uint32_t installation, const char* name, const char* value);

/* Puts a copy's name in place of "$CurrentInstallationName$", or else of "$DefaultInstallationName$". With a size the
 * result goes to `output`; with 0 to a buffer of the library, which the next call overwrites. Returns `text` itself
 * where nothing was replaced; null where `text` does not fit into `output_size`. */
const char* iSubstituteCopyName(const char* text, const char* copy_name, uint32_t output_size, char* output);

#ifdef __cplusplus
}
#endif

#endif
