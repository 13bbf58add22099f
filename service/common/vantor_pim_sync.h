/* vantor_pim_sync.h: the call interface of the vantor-pim-sync daemon.
 *
 * The daemon exports these functions from its own file; libvantor-pim-sync offers the same functions to
 * other programs and carries the calls over IPC. All return 0 on success and a negative code on failure.
 *
 * Threads: the thread that runs the default GLib main context; callbacks are delivered there.
 * Ownership: records are allocated with calloc, their strings with strdup; whoever receives one releases it with
 * vantor_pim_sync_free_account. Strings may be NULL.
 */
#ifndef VANTOR_PIM_SYNC_H
#define VANTOR_PIM_SYNC_H

#include <stdbool.h>
#include <stdint.h>

#ifdef __cplusplus
extern "C" {
#endif

#define VANTOR_PIM_SYNC_EXPORT __attribute__((visibility("default")))

/* The data kind that a call is about. */
typedef enum {
    VANTOR_PIM_SYNC_TYPE_CALENDAR = 0, /* events and to-dos */
    VANTOR_PIM_SYNC_TYPE_CONTACTS = 1,
} vantor_pim_sync_type_e;

/* The state that vantor_pim_sync_get_state answers. */
typedef enum {
    SYNC_AGENT_STATE_NONE = 0,        /* the account has no agent of this kind */
    SYNC_AGENT_STATE_READY = 1,       /* idle, a sync may be started */
    SYNC_AGENT_STATE_IN_PROGRESS = 2, /* a sync is running */
    SYNC_AGENT_STATE_UNAVAILABLE = 3, /* the refresh token is no longer accepted; update the account */
} vantor_pim_sync_state_e;

typedef struct {
    int32_t account_id;  /* the account service's id */
    char* access_token;  /* never stored */
    char* refresh_token; /* in the daemon it comes from the account's key file */
    char* email;
    int32_t reserved;      /* carried, not stored, not read */
    bool ssl;              /* a bare host below is reached over https */
    bool calsync;          /* calendar sync on */
    char* calserver;       /* URL or bare host */
    int32_t calserverport; /* appended when above 0 and the text has none */
    bool ctsync;           /* contacts sync on */
    char* ctserver;
    int32_t ctserverport;
    int32_t calperiod; /* minutes between scheduled syncs; below 1: on request only */
    int32_t ctperiod;
    int32_t roaming; /* 0: no scheduled sync while roaming */
} vantor_pim_sync_account_s;

typedef void (*vantor_pim_sync_state_changed_cb)(vantor_pim_sync_type_e type, void* user_data);

/* Made by every call that needs it; in a client this connects to the daemon, and finalize disconnects and drops all callbacks. */
VANTOR_PIM_SYNC_EXPORT int vantor_pim_sync_initialize(void);
VANTOR_PIM_SYNC_EXPORT int vantor_pim_sync_finalize(void);

/* -28: the storage is full. */
VANTOR_PIM_SYNC_EXPORT int vantor_pim_sync_add_account(const vantor_pim_sync_account_s* account);
VANTOR_PIM_SYNC_EXPORT int vantor_pim_sync_remove_account(int account_id);
/* NULL strings and ports of 0 keep what was there. */
VANTOR_PIM_SYNC_EXPORT int vantor_pim_sync_update_account(const vantor_pim_sync_account_s* account);
VANTOR_PIM_SYNC_EXPORT int vantor_pim_sync_get_account(int account_id, vantor_pim_sync_account_s** account);

/* Start asks for a sync and returns; the state tells when it has ended. */
VANTOR_PIM_SYNC_EXPORT int vantor_pim_sync_start(int account_id, vantor_pim_sync_type_e type);
VANTOR_PIM_SYNC_EXPORT int vantor_pim_sync_stop(int account_id, vantor_pim_sync_type_e type);
/* A NULL state is not an error. */
VANTOR_PIM_SYNC_EXPORT int vantor_pim_sync_get_state(int account_id, vantor_pim_sync_type_e type, int* state);
/* Seconds since 1970 of the last successful download, 0 when there was none. */
VANTOR_PIM_SYNC_EXPORT int vantor_pim_sync_get_sync_time(int account_id, vantor_pim_sync_type_e type,
                                                         int* time);

/* The callback is called after every state change of any account for this kind. */
VANTOR_PIM_SYNC_EXPORT int vantor_pim_sync_add_state_changed_cb(vantor_pim_sync_type_e type,
                                                                vantor_pim_sync_state_changed_cb callback,
                                                                void* user_data);
VANTOR_PIM_SYNC_EXPORT int vantor_pim_sync_remove_state_changed_cb(vantor_pim_sync_type_e type,
                                                                   vantor_pim_sync_state_changed_cb callback,
                                                                   void* user_data);

/* NULL is allowed. */
VANTOR_PIM_SYNC_EXPORT void vantor_pim_sync_free_account(vantor_pim_sync_account_s* account);

#ifdef __cplusplus
}
#endif

#endif
