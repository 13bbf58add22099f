/* sync_now: brings the calendars of an account in step, and waits until that is done.
 *
 *     cc sync_now.c -o sync_now $(pkg-config --cflags --libs vantor-pim-sync glib-2.0)
 *     ./sync_now 7
 */
#include <glib.h>
#include <stdio.h>
#include <stdlib.h>
#include <vantor_pim_sync.h>

typedef struct {
    int account;
    GMainLoop* loop;
} job_s;

/* Called by the main loop after every change of any account's state. */
static void on_state_changed(vantor_pim_sync_type_e type, void* user_data) {
    const job_s* job = user_data;
    int state = SYNC_AGENT_STATE_NONE;
    if (vantor_pim_sync_get_state(job->account, type, &state) != 0) return;
    if (state != SYNC_AGENT_STATE_IN_PROGRESS) g_main_loop_quit(job->loop);
}

int main(int argc, char** argv) {
    if (argc != 2) {
        fprintf(stderr, "usage: sync_now ACCOUNT\n");
        return 2;
    }
    job_s job = {atoi(argv[1]), g_main_loop_new(NULL, FALSE)};
    int failed = vantor_pim_sync_initialize() != 0 ||
                 vantor_pim_sync_add_state_changed_cb(VANTOR_PIM_SYNC_TYPE_CALENDAR, on_state_changed, &job) != 0 ||
                 vantor_pim_sync_start(job.account, VANTOR_PIM_SYNC_TYPE_CALENDAR) != 0;
    if (failed) {
        fprintf(stderr, "the daemon does not run, or does not sync the account %d\n", job.account);
    } else {
        /* The sync may have ended before the loop runs. */
        on_state_changed(VANTOR_PIM_SYNC_TYPE_CALENDAR, &job);
        int state = SYNC_AGENT_STATE_NONE;
        vantor_pim_sync_get_state(job.account, VANTOR_PIM_SYNC_TYPE_CALENDAR, &state);
        if (state == SYNC_AGENT_STATE_IN_PROGRESS) g_main_loop_run(job.loop);
        int seconds = 0;
        failed = vantor_pim_sync_get_sync_time(job.account, VANTOR_PIM_SYNC_TYPE_CALENDAR, &seconds) != 0;
        if (!failed) printf("last in step at %d seconds after 1970\n", seconds);
    }
    vantor_pim_sync_finalize();
    g_main_loop_unref(job.loop);
    return failed ? 1 : 0;
}
