/**
 * @file
 * The whole platform layer.
 */
#ifndef KORVEL_PAL_KD_H
#define KORVEL_PAL_KD_H

#include "pal/kd_assert.h"
#include "pal/kd_event.h"
#include "pal/kd_file.h"
#include "pal/kd_log.h"
#include "pal/kd_thread.h"
#include "pal/kd_time.h"
#include "pal/kd_types.h"

#endif
