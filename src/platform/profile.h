// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#ifndef PROFILE_H
#define PROFILE_H

// Sound profiles: named sets of text values (tones, volumes, switches) with
// one profile active at a time, kept in dconf:
//
//   /org/orbaline/themelet/profile                   name of the active profile
//                                                    (unset: "general")
//   /org/orbaline/themelet/profiles/<profile>/<key>  one value of a profile
//
// A value that a profile hasn't set is read from the defaults file
// $THEMELET_SYSROOT<sysconfdir>/themelet/profiles.ini (see ProfileDefaults), first from
// the profile's own group, then from the group [fallback]. The profile
// "fallback" holds the system's own tones.
//
// Conventions of this interface:
// - Text is UTF-8. Profile names and keys are non-empty and hold no "/".
// - Strings returned are allocated with malloc: the caller frees them with free().
// - Setters return 0 on success and -1 on failure (logged).
// - Everything, callbacks included, runs on the thread that first used the
//   key-value store; callbacks come from its event loop, never from inside
//   a setter.

// Text of the value, or null when neither the profile nor the defaults have
// the key. Integers read as decimal text, booleans as "true" or "false".
char *profile_get_value(const char *profile, const char *key);
// An empty or null value clears the key, so that the default shows again.
int profile_set_value(const char *profile, const char *key, const char *value);

// An unset key reads 0; text reads as its leading decimal number.
int profile_get_value_as_int(const char *profile, const char *key);
int profile_set_value_as_int(const char *profile, const char *key, int value);

// 0 or 1; text reads as profile_parse_bool does.
int profile_get_value_as_bool(const char *profile, const char *key);
int profile_set_value_as_bool(const char *profile, const char *key, int value);

// 1 for "true", "on", "yes" (any case) and a non-zero decimal number, else 0.
int profile_parse_bool(const char *text);

// Name of the active profile.
char *profile_get_profile(void);
int profile_set_profile(const char *profile);

// Change notices. A profile callback gets the name of the new active
// profile. A value callback gets the profile, the key, the value's text and
// its type ("string", "integer", "boolean", "double"; both null when the key
// has no value), read when the callback runs, so that after two quick
// changes both notices show the latter value. Active callbacks hear of
// changes to the active profile, change callbacks of changes to all others.
// Callbacks run only while the tracker runs.
typedef void (*profile_track_profile_fn)(const char *profile, void *user_data);
typedef void (*profile_track_value_fn)(const char *profile, const char *key, const char *value,
                                       const char *type, void *user_data);
// Called with the user data when its callback is removed; may be null.
typedef void (*profile_user_data_free_fn)(void *user_data);

// Starting a running tracker, or stopping a stopped one, does nothing: the
// caller counts its users.
int profile_tracker_init(void);
void profile_tracker_quit(void);

// The store connects on first use; kept for callers that ask for it.
void profile_connection_enable_autoconnect(void);

void profile_track_add_profile_cb(profile_track_profile_fn callback, void *user_data,
                                  profile_user_data_free_fn free_user_data);
void profile_track_remove_profile_cb(profile_track_profile_fn callback, void *user_data);
void profile_track_add_active_cb(profile_track_value_fn callback, void *user_data,
                                 profile_user_data_free_fn free_user_data);
void profile_track_remove_active_cb(profile_track_value_fn callback, void *user_data);
void profile_track_add_change_cb(profile_track_value_fn callback, void *user_data,
                                 profile_user_data_free_fn free_user_data);
void profile_track_remove_change_cb(profile_track_value_fn callback, void *user_data);

#endif
