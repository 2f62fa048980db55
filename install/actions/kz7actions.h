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

/* Custom action, immediate: deletes the values that an earlier installation saved, then saves those that deferred
 * actions will need where iMsiGetProperty() finds them. The properties RSP_FILE_PATH and KZ7_MESSAGES, if they are set,
 * name the response file and a file with the texts of another language. 6045: not in an immediate action.
 *
 * Secrets are among the saved values, in a key of the user who installs: schedule iDeleteSavedProperties as a commit
 * action, as a rollback action, and as an immediate action for each failing exit, with the sequence numbers -2
 * (cancelled) and -3 (failed): an installation that fails before its deferred phase runs no rollback action. The exit
 * may come before the rollback: if rollback actions read saved values, set a property just before InstallFinalize and
 * let the failing exits delete only without it. With rollback switched off (RollbackDisabled) neither rollback nor
 * commit actions run: the failing exits delete in any case, and the sequence number -1 (success) needs the action as
 * well. */
uint32_t iSavePropertiesForDeferred(uint32_t installation);

/* Custom action of any kind: deletes the saved values. */
uint32_t iDeleteSavedProperties(uint32_t installation);

/* Reads a property in immediate and deferred actions alike. In a deferred action UserSID, CustomActionData and
 * ProductCode come from the installer; a saved value counts only if the installer has none. Every other value comes
 * from a key that the user can write: never use one as the path of a file to run or load. `size` is the size of the
 * buffer in bytes on entry, and the size of the value on return: a saved value counts its NUL, a value of the installer
 * does not. 234: the buffer is too small; `size` is then a hint, which may be twice what is needed. 1,024 bytes are
 * enough for every saved value. 87: an argument is null; 5021: `name` or `buffer` is null in an immediate action. */
uint32_t iMsiGetProperty(uint32_t installation, const char* name, char* buffer, uint32_t* size);

/* Sets a property; a null or empty value unsets it. 87: `name` is null. */
uint32_t iMsiSetProperty(uint32_t installation, const char* name, const char* value);

/* Puts a copy's name in place of "$CurrentInstallationName$", or else of "$DefaultInstallationName$". With a size the
 * result goes to `output`; with 0 to a buffer of the library, which the next call overwrites. Returns `text` itself
 * if nothing is replaced, as with a null or empty copy name. Returns null if `text` is null or does not fit into
 * `output_size`, or if a size is given and `output` is null. */
const char* iSubstituteCopyName(const char* text, const char* copy_name, uint32_t output_size, char* output);

#ifdef __cplusplus
}
#endif

#endif
