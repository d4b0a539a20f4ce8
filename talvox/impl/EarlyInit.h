/**
 * @file
 * Constants that static initialisers may use.
 */
#pragma once

/**
 * Marks the definition of a constant of the library that has a constructor: it is made before all
 * unmarked objects of the library, so an initialiser in any file may use it.
 */
#define TALVOX_EARLY __attribute__((init_priority(150)))
