/* The generation lock of the store as a model: the fields and steps of GenerationLock.h and .cpp under their own names.
   What the mutex guards is one step; it is left only to sleep. A broadcast wakes only who sleeps at that moment, and
   the mutex is let go before it. Readers announce themselves in lines of their own, one step a word. The committed
   tree is two cells that a merge writes one after the other and that readers look at without the mutex.

   spin -a -DREADERS=2 -DWRITERS=2 GenerationLock.pml; cc -O2 -DSAFETY -o pan pan.c; ./pan -m100000
   -DMUTANT=n seeds a mistake that the run must find: 1 no look at the commit after announcing, 2 the commit does not
   look at the lines, 3 the pushed generation leaves the writer queued, 4 the gate opens before the merge, 5 leaving a
   line wakes nobody, 6 a broadcast wakes one sleeper only. */

#ifndef READERS
#define READERS 2
#endif
#ifndef WRITERS
#define WRITERS 2
#endif
#ifndef ROUNDS
#define ROUNDS 2
#endif
#ifndef MUTANT
#define MUTANT 0
#endif
#define SLOTS 6

bool Locked;
byte Count[SLOTS];           /* m_Fifo: holders, from the front */
byte Size;
byte Current = 1;
bool bWriterQueued, bCommitting, bCommit, bDrainWaits;
bool Reading[READERS];       /* the lines */
bool DrainSleeps;            /* the one committer sleeps */
bool AdvanceSleeps[READERS + WRITERS];
byte CellA, CellB;           /* the committed tree: the number of its last commit */
byte InWrite, Finished;

inline Lock() { atomic { !Locked -> Locked = true } }
inline Unlock() { Locked = false }

inline Pop() {
  d_step {
    i = 0;
    do
    :: i + 1 < Size -> Count[i] = Count[i + 1]; i++
    :: else -> break
    od;
    Size--;
    Count[Size] = 0;
    i = 0
  }
}

inline Broadcast() {
  d_step {
    i = 0;
    do
      :: i < READERS + WRITERS ->
       if
       :: MUTANT == 6 && AdvanceSleeps[i] -> AdvanceSleeps[i] = false; break
       :: else -> AdvanceSleeps[i] = false
       fi;
       i++
    :: else -> break
    od;
    i = 0
  }
}

/* A sleeper has let the mutex go in the step in which it fell asleep. */
inline WaitAdvance( target ) {
  do
  :: Current == target -> break
  :: else ->
     atomic { AdvanceSleeps[me] = true; Locked = false };
     !AdvanceSleeps[me];
     Lock()
  od
}

inline AnyReading( result ) {
  /* Line by line, as readers go on meanwhile. */
  result = false;
  i = 0;
  do
  :: i < READERS ->
     if
     :: Reading[i] && MUTANT != 2 -> result = true
     :: else
     fi;
     i++
  :: else -> break
  od;
  i = 0
}

inline LeaveLine() {
  Reading[me] = false;
  if
  :: bDrainWaits && MUTANT != 5 ->
     Lock(); Unlock();
     DrainSleeps = false
  :: else
  fi
}

proctype Reader( byte me ) {
  byte i, round, seen, other, target;
  bool counted;
  for ( round : 1 .. ROUNDS ) {
    /* BeginRead */
    counted = false;
    Reading[me] = true;
    if
    :: bCommit && MUTANT != 1 ->
       LeaveLine();
       Lock();
       atomic {
         counted = true;
         if
         :: Size == 0 -> Size = 1; Count[0] = 1; bWriterQueued = false; target = Current
         :: Size != 0 && !bCommitting -> Count[0]++; target = Current
         :: else ->
            target = Current + 1;
            if
            :: Size > 1 -> Count[1]++
            :: else -> Count[1] = 1; Size = 2;
               if
               :: MUTANT != 3 -> bWriterQueued = false
               :: else
               fi
            fi
         fi
       };
       WaitAdvance( target );
       Unlock()
    :: else
    fi;
    /* inside: the tree is the commit that Generation() says, from begin to end */
    seen = Current - 1;
    other = CellA;
    assert( other == seen );
    other = CellB;
    assert( other == seen );
    other = CellA;
    assert( other == seen && Current - 1 == seen );
    /* EndRead */
    if
    :: counted ->
       Lock();
       Count[0]--;
       if
       :: Count[0] == 0 && bCommitting -> Unlock(); DrainSleeps = false
       :: Count[0] == 0 && !bCommitting -> assert( Size == 1 ); Pop(); Unlock()
       :: else -> Unlock()
       fi
    :: else -> LeaveLine()
    fi
  };
  Finished++
}

proctype Writer( byte me ) {
  byte i, round, target, number;
  bool reading;
  for ( round : 1 .. ROUNDS ) {
    /* BeginWrite */
    Lock();
    atomic {
      target = Current + Size;
      if
      :: Size != 0 && !bWriterQueued -> target--; Count[Size - 1]++
      :: else -> assert( Size < SLOTS ); Count[Size] = 1; Size++
      fi;
      bWriterQueued = true
    };
    WaitAdvance( target );
    Unlock();
    assert( InWrite == 0 );
    InWrite++;
    assert( CellA == Current - 1 && CellB == CellA );
    InWrite--;
    /* EndWrite: BeginCommit */
    Lock();
    Count[0]--;
    bCommitting = true;
    bCommit = true;
    AnyReading( reading );
    if
    :: Count[0] != 0 || reading ->
       bDrainWaits = true;
       do
       :: AnyReading( reading );
          if
          :: Count[0] == 0 && !reading -> break
          :: else ->
             atomic { DrainSleeps = true; Locked = false };
             !DrainSleeps;
             Lock()
          fi
       od;
       bDrainWaits = false
    :: else
    fi;
    Pop();
    bCommitting = false;
    if
    :: MUTANT == 4 -> bCommit = false
    :: else
    fi;
    number = Current;
    Current++;
    assert( number == target );
    /* the merge */
    CellA = number;
    CellB = number;
    bCommit = false;
    Unlock();
    Broadcast()
  };
  Finished++
}

init {
  byte p;
  atomic {
    for ( p : 0 .. READERS - 1 ) { run Reader( p ) }
    for ( p : READERS .. READERS + WRITERS - 1 ) { run Writer( p ) }
  };
  Finished == READERS + WRITERS;
  assert( Size == 0 && !bCommitting && !bCommit && Current == 1 + WRITERS * ROUNDS )
}
